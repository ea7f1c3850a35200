/// Records that describe files, and two helpers for files of a repository.
///
/// All records are plain values without locks; all paths are relative to the working folder unless said otherwise.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_repo_prop.h"

#include "platform/sdk/OdString.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <memory>

namespace common {

class MetaInfo;

/// What happened to a file between two versions.
enum class FileChange : std::int32_t { added = 0, modified = 1, removed = 2 };

/// "added", "modified" or "removed". Error: any other value.
MU_COMMON_EXPORT Expected<OdString> toString(FileChange change);

/// The change that `text` names (case-sensitive). Error: any other text.
MU_COMMON_EXPORT Expected<FileChange> toFileChange(OdString const& text);

/// One change staged for the next commit.
struct MU_COMMON_EXPORT StagedFile {
    /// Stores both.
    StagedFile(OdString const& path, FileChange change);

    /// Same path (case-sensitive) and same change.
    bool operator==(StagedFile const& other) const;

    OdString path;     ///< relative to the working folder
    FileChange change; ///< what is staged for it
};

/// Base of file records that are held through pointers.
class MU_COMMON_EXPORT BaseFile {
public:
    /// Stores the path.
    explicit BaseFile(OdString const& path);
    BaseFile(BaseFile const&) = default;
    BaseFile& operator=(BaseFile const&) = default;
    virtual ~BaseFile();

    OdString path; ///< relative to the working folder
};

/// A file as the server records it and as it is sent with a commit.
class MU_COMMON_EXPORT RepoFile : public BaseFile {
public:
    /// Without a previous version.
    RepoFile(OdString const& path, OdString const& storagePath);
    /// Takes over `base`, which may be null.
    RepoFile(OdString const& path, OdString const& storagePath, std::unique_ptr<BaseFile> base);

    OdString storagePath;           ///< storage URL of the content
    std::shared_ptr<BaseFile> base; ///< the previous version, with the previous path of a renamed file; may be null
};

/// A candidate for staging.
struct MU_COMMON_EXPORT PossibleRepoFile {
    /// Members without an argument stay unset.
    ///@{
    explicit PossibleRepoFile(OdString const& path);
    PossibleRepoFile(OdString const& path, OdString const& storagePath);
    PossibleRepoFile(OdString const& path, OdString const& storagePath, OdString const& previousPath);
    PossibleRepoFile(OdString const& path, boost::optional<OdString> const& storagePath);
    PossibleRepoFile(OdString const& path, boost::optional<OdString> const& storagePath, OdString const& previousPath);
    ///@}

    OdString path;                          ///< relative to the working folder
    boost::optional<OdString> storagePath;  ///< storage URL, when it is known already
    boost::optional<OdString> previousPath; ///< path before a rename, when there was one
};

/// A file in the working folder.
struct File {
    OdString path; ///< relative to the working folder
};

/// A file version recorded in a commit.
struct VersionedFile {
    OdString path;        ///< relative to the working folder
    OdString storagePath; ///< storage URL of the content
};

/// The two versions of one file that belong together. `void` stands for a side that is absent. `metaInfo` holds a
/// `ConflictInfo` for a conflicted file, a `ParentInfo` with parent commits, or nothing. Copies share the objects that
/// the pointers lead to. `hostValue` is for the host to use: the library only stores it.
template <class A, class B>
struct Versions;

/// A file of the working folder that the last commit has too.
template <>
struct Versions<File, VersionedFile> {
    std::shared_ptr<MetaInfo> metaInfo; ///< may be null
    File working;                       ///< in the working folder
    VersionedFile committed;            ///< in the last commit
    std::int32_t hostValue = 0;         ///< the host's
};

/// A file that only the working folder has.
template <>
struct Versions<File, void> {
    std::shared_ptr<MetaInfo> metaInfo; ///< may be null
    File working;                       ///< in the working folder
    std::int32_t hostValue = 0;         ///< the host's
};

/// A file that only the last commit has.
template <>
struct Versions<void, VersionedFile> {
    std::shared_ptr<MetaInfo> metaInfo; ///< may be null
    VersionedFile committed;            ///< in the last commit
    std::int32_t hostValue = 0;         ///< the host's
};

/// A file of a received commit.
template <>
struct MU_COMMON_EXPORT Versions<VersionedFile, std::shared_ptr<File>> {
    /// Without previous path and extra information.
    explicit Versions(VersionedFile current);
    /// Takes over both owners. `Expected`'s in-place construction empties them before they arrive here.
    Versions(VersionedFile current, std::unique_ptr<File> previous, std::unique_ptr<MetaInfo> metaInfo);

    std::shared_ptr<MetaInfo> metaInfo; ///< may be null
    VersionedFile current;              ///< as the commit has it
    std::shared_ptr<File> previous;     ///< previous path of a renamed file; may be null
};

/// Appends the line "<local time> - <text>" to the log file of `root`, in UTF-8, creating the file if necessary.
/// False when the file cannot be opened or is not a regular file; never blocks on it. Write errors are not detected.
/// Any thread may call it, but lines that are written at the same time may mix.
MU_COMMON_EXPORT bool logString(OdString const& text, RootPath const& root);

/// Whether the working file `relativePath` of `root` differs from the recorded `hash`: a prefix of three characters
/// followed by the SHA-256 digest in lower-case hexadecimal digits. A hash that begins with "tf" names a revision
/// store; the file then counts as different and is not read. A file that cannot be opened counts as empty; all bytes
/// from the first unreadable one count as zeros.
/// Reads the whole file in pieces, so memory does not grow with it. Any thread may call it.
MU_COMMON_EXPORT bool isDifferent(OdString const& relativePath, OdString const& hash, RootPath const& root);

} // namespace common
