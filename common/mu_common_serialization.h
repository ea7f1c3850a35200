/// The documents that the host exchanges with the server.
///
/// Readers are named `deserialize...` and take a parsed object or the text of a whole document; writers are named
/// `serialize...` and build objects, which `kutils::json::write_string` turns into text. Nothing here touches a file or
/// the network, and nothing is shared between calls: any thread may call anything.
///
/// How readers fail: a required member that is missing gives an error with a translated message; the first error ends
/// the reading and nothing partial is returned. A member of the wrong type, a whole text of the wrong type (one that is
/// no JSON included) and the few members noted below throw `JsonParseError`. Members that a reader does not know are
/// ignored. Writers fail only when memory runs out.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_versions.h"

#include "platform/sdk/OdString.h"
#include "platform/sdk/OdTimeStamp.h"
#include "json/json_value.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <memory>
#include <vector>

namespace common {

/// Kind of a reference.
enum class EType : std::int32_t { branch = 0, tag = 1 };

/// Who made a commit, when, and why.
struct Annotation {
    OdString author;  ///< as the server reports it
    OdString message; ///< empty when the document has none
    OdTimeStamp date; ///< in universal time
};

/// A branch or a tag.
struct MU_COMMON_EXPORT Reference {
    /// Copies its arguments.
    Reference(
        OdString const& name, OdString const& commitHash, EType type,
        boost::optional<Annotation> const& annotation = boost::none);

    OdString name;                          ///< of the branch or tag
    OdString commitHash;                    ///< hash of the commit that it points to
    EType type;                             ///< branch or tag
    boost::optional<Annotation> annotation; ///< only the host sets one: no document that is read or written carries it
};

/// A repository as the server lists it.
struct RepoData {
    OdString name;        ///< shown to the user
    OdString id;          ///< the server's identifier
    OdString description; ///< empty in everything that is read
};

/// The parent commits of the commit that a file version belongs to.
class MU_COMMON_EXPORT ParentInfo : public MetaInfo {
public:
    /// Copies the hashes.
    explicit ParentInfo(std::vector<OdString> const& parents);

    std::vector<OdString> parents; ///< their hashes
};

/// A file of a received commit.
using ReceivedFile = Versions<VersionedFile, std::shared_ptr<File>>;

/// A commit as the server sends it.
struct MU_COMMON_EXPORT Commit {
    /// Takes the files over and copies the rest.
    Commit(
        Annotation const& annotation, std::vector<ReceivedFile> files, std::vector<OdString> const& parents,
        OdString const& hash, int commitNo);

    Annotation annotation;           ///< author, message, date
    std::vector<ReceivedFile> files; ///< in document order; neither previous paths nor parents are ever set in them
    std::vector<OdString> parents;   ///< hashes, in document order
    OdString hash;                   ///< its own
    int commitNo;                    ///< the server's running number
};

/// A new commit, on its way to the server. The host fills it in.
struct CommitInfo {
    std::vector<RepoFile> files;       ///< of the whole commit
    std::vector<Reference> references; ///< to create or move with the commit
    std::vector<OdString> parents;     ///< hashes
    /// Its own. The host makes it, and the library sends it as it is: 64 lower-case hexadecimal digits that no other
    /// commit has, such as the SHA-256 digest of everything else in the commit.
    OdString hash;
    OdString author;  ///< as the server shall show it
    OdString message; ///< why it was made
};

/// What a fetch brings.
struct FetchData {
    RepoData repository;               ///< the fetched one
    std::vector<Commit> commits;       ///< those that the client lacks, in document order
    std::vector<Reference> references; ///< in document order
};

/// The number that the server gave to a commit.
struct CommitNumberPair {
    OdString hash; ///< of the commit
    int commitNo;  ///< the server's running number
};

/// The kind that `text` names, letter case counting. Error: any other text than "branch" and "tag"; not translated.
MU_COMMON_EXPORT Expected<EType> toType(OdString const& text);

/// Reads a reference: "commitHash", "name" and "refType" are required and checked in this order. An "annotation" that
/// is an object is read and dropped: its missing members do no harm, but one of a wrong type throws.
MU_COMMON_EXPORT Expected<Reference> deserializeReference(kutils::json::Object const& object);
/// Reads the text of an array of references.
MU_COMMON_EXPORT Expected<std::vector<Reference>> deserializeReferences(OdString const& text);

/// Reads a repository: "name" and "id" are required and checked in this order.
MU_COMMON_EXPORT Expected<RepoData> deserializeRepoData(kutils::json::Object const& object);
/// Reads the text of one.
MU_COMMON_EXPORT Expected<RepoData> deserializeRepoData(OdString const& text);
/// Reads the text of an array of repositories.
MU_COMMON_EXPORT Expected<std::vector<RepoData>> deserializeRepoDatas(OdString const& text);

/// Reads an annotation: "author" and "date" are required and checked in this order. "date" must be a real number
/// (1.0, not 1): seconds since 1970-01-01T00:00:00Z, truncated toward zero and kept within 64 bits; NaN, which no text
/// gives, counts as 0.
MU_COMMON_EXPORT Expected<Annotation> deserializeAnnotation(kutils::json::Object const& object);
/// Writes an annotation. `date` is text here: what is written is not in the form that is read.
MU_COMMON_EXPORT kutils::json::Object
serializeAnnotation(OdString const& author, OdString const& date, OdString const& message);

/// Reads an array of hashes. Error: an element that is no string.
MU_COMMON_EXPORT Expected<std::vector<OdString>> deserializeParentHashes(kutils::json::Array const& array);

/// Reads a file of a commit: "storagePath" and "path" are required and checked in this order. A "previousPath" must be
/// a text or null; it leaves no trace in the result, and neither do `parentHashes`.
MU_COMMON_EXPORT Expected<ReceivedFile>
deserializeRepoFile(kutils::json::Object const& object, std::vector<OdString> const& parentHashes);

/// Reads a commit, its members in this order: "annotation", "parentsHashes" (which may be absent), "files", "hash",
/// "commitNo". A missing "annotation" or "files" throws.
MU_COMMON_EXPORT Expected<Commit> deserializeCommit(kutils::json::Object const& object);

/// Writes a commit, stamped with the current universal time.
MU_COMMON_EXPORT kutils::json::Object serializeCommit(
    std::vector<RepoFile> const& files, OdString const& author, OdString const& message, OdString const& hash,
    std::vector<OdString> const& parentHashes);
/// Writes the whole document for a new commit: the commit and its references, without their annotations.
MU_COMMON_EXPORT kutils::json::Value serializeCommitInfo(CommitInfo const& info);

/// Reads what a fetch brings. "repository" is required. Commits come only with "references", references also alone.
MU_COMMON_EXPORT Expected<FetchData> deserializeFetchData(kutils::json::Object const& object);

/// Reads a commit's number: "hash" and "commitNo" are required and checked in this order.
MU_COMMON_EXPORT Expected<CommitNumberPair> deserializeCommitNumber(kutils::json::Object const& object);
/// Reads an array of them.
MU_COMMON_EXPORT Expected<std::vector<CommitNumberPair>> deserializeCommitNumbers(kutils::json::Array const& array);

/// Reads the answer to creating a repository: its id.
MU_COMMON_EXPORT Expected<OdString> deserializeInitData(kutils::json::Object const& object);

/// Reads the text of the server's version: that of its commands, as it stands.
MU_COMMON_EXPORT Expected<OdString> deserializeServerVersion(OdString const& text);

} // namespace common
