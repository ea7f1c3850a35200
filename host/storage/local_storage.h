/// The storage inside ".tav", where the contents of all versions are kept.
///
/// A drawing's versions are appended to a revision store, ".tav/tf/NAME.tf"; every other content is an object of its
/// own, ".tav/objects/DIGEST". Either is stored as the difference to the version before it, or to a similar content, if
/// that is smaller. All of it is compressed with zstd, checked against its SHA-256 digest whenever it is read, and
/// described in docs/formats/storage.md.
///
/// URLs are "tf:NAME#DIGEST" and "po:DIGEST" (host/storage/storage_url.h): a URL names the same content in every
/// repository. Equal contents are stored once, so a drawing may get the URL of an object, and the other way round.
///
/// Contents are stored in batches, and nothing in a batch is permanent until it is flushed:
///
///     LocalStorage storage(root, {previousUrl, knownUrl, similarUrls});
///     auto const plan = storage.store(L"plan.dwg"); // its URL, for this object only
///     auto const note = storage.store(L"note.txt");
///     storage.flush();                              // now permanent; without it both are removed
///     storage.verify(plan.value());                 // reads back what a commit is about to rely on
///
/// One thread at a time. Only the holder of the repository's lock may change the storage; reading needs no lock. All
/// errors are English sentences that name the file or content. No content ends the process: running out of memory is an
/// error too. The code of an error is the system's, as in `errno`, and 0 where a content is missing or damaged.
///
/// Memory: files up to 64 MiB are held whole, with their base, a spare for unpacking it and the result, so a file of n
/// MiB needs about four times n. Longer contents are processed in segments of 64 MiB, whatever the length. No operation
/// uses more than some 400 MiB; storing a second version of a file of 1.5 GiB was measured to use 223.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_repo_prop.h"

#include "host/storage/batch.h"
#include "host/storage/content_reader.h"
#include "host/storage/content_writer.h"
#include "host/storage/freed.h"
#include "host/storage/object_bases.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace tav {

class Samples;

/// See above.
class LocalStorage {
public:
    /// What else is stored, so that a content can be stored as the difference to it. Each may be empty, and may answer
    /// with an empty text.
    struct Versions {
        /// For a path, the URL of that file's version in the last commit, under its former path if it was renamed.
        std::function<OdString(OdString const& path)> previous;
        /// For a digest, the URL under which its content is stored already.
        std::function<OdString(Digest const& digest)> known;
        /// For the path of a file without a version before, a few URLs of contents that it may resemble, the most
        /// likely first.
        std::function<std::vector<OdString>(OdString const& path)> similar;
    };

    /// The storage of the repository `root`. Only tests pass a `segmentLog`: contents are processed in segments
    /// of 2^`segmentLog` bytes.
    explicit LocalStorage(common::RootPath root, Versions versions = {}, unsigned segmentLog = kSegmentLog);
    LocalStorage(LocalStorage const&) = delete;
    LocalStorage& operator=(LocalStorage const&) = delete;
    /// Removes what was stored and not flushed.
    ~LocalStorage() = default;

    /// Stores the content of `path`, which is relative to the working folder. Pass the URL on only after `flush` has
    /// succeeded; this object can read the content immediately. Storing it again gives the same URL. A content that is
    /// stored already is read, once per batch, and stored again under its URL if it is damaged or missing. What is
    /// stored is what was read, under its own digest; a file that changes during the call is an error ("has changed
    /// while it was being stored"), after which the caller tries again. An error leaves nothing of the file behind.
    Expected<OdString> store(OdString const& path);
    /// Waits until everything stored since the last flush is safe on the disk, with one flush. After an error all of it
    /// has been removed, and its URLs are void.
    WriteOutcome flush();
    /// Makes the content at `url` readable: if it is damaged or missing, it is stored again from the file `path`,
    /// relative to the working folder, which must have that content, then flushed and read back. True when it was
    /// stored again.
    Expected<bool> repair(OdString const& url, OdString const& path);

    /// The URLs of all stored contents, in ascending order, whether a commit has them or not.
    Expected<std::set<OdString>> contents() const;
    /// Whether the content is stored; `verify` checks that it is intact. Error: not a URL of this storage.
    Expected<bool> contains(OdString const& url) const;
    /// Length of the content in bytes, without unpacking it.
    Expected<std::uint64_t> size(OdString const& url) const;
    /// Passes the content to `sink`, piece by piece. Until this returns success, the content may still turn out to be
    /// damaged. A sink that returns false receives no more; that is an error too ("was not read to its end").
    WriteOutcome read(OdString const& url, std::function<bool(char const*, std::size_t)> const& sink) const;
    /// Reads the content and checks its digest.
    WriteOutcome verify(OdString const& url) const;
    /// Writes the content into the new file `path`, a full path in bytes, and does not flush it. When the name exists,
    /// nothing is changed; after any other error there is no file.
    WriteOutcome extract(OdString const& url, std::string const& path) const;

    /// Stores the object at `url`, a version of the file `path`, as the difference to the version before it or to a
    /// similar content, or else compresses it more thoroughly, if it is whole and that is smaller. Returns what became
    /// free. The new form is written beside
    /// the old one, flushed, read back, and renamed over it; call `flush` at the end. After an error the object is
    /// unchanged. Meant for one pass over all objects, older versions first: which objects build on which is read only
    /// once.
    Expected<Freed> turnOver(OdString const& url, OdString const& path);
    /// Removes everything but `urls` and what they build on, and what interrupted operations have left.
    /// A store is rewritten beside the old one, flushed, read back, and renamed over it. A store in which something to
    /// be kept cannot be read is left unchanged, and so are all objects if the header of one to be kept cannot be read;
    /// the rest is cleaned, and then this is reported as the error. A store that belongs to one of `elsewhere`, URLs of
    /// contents that need not be here, is also left unchanged, which is not an error. What was stored and not flushed
    /// is flushed first.
    Expected<Freed> keepOnly(std::set<OdString> const& urls, std::set<OdString> const& elsewhere = {});
    /// Removes only what interrupted operations have left. No content is removed, whether a commit needs it or not.
    Expected<Freed> removeLeftovers();

private:
    Content open(OdString const& path) const;
    std::optional<StorageUrl> knownPlace(Digest const& digest) const;
    std::optional<StorageUrl> previousVersion(OdString const& path) const;
    OdString storeAgain(OdString const& path, Content const& content, StorageUrl const& url);
    OdString storeNew(OdString const& path, Content const& content, Digest const& digest);
    std::optional<StorageUrl> baseFor(OdString const& path, Content const& content, bool isObject);
    std::optional<StorageUrl> similarContent(OdString const& path, Content const& content, bool isObject);
    bool isSimilar(Samples& samples, StorageUrl const& url);
    std::optional<Digest> newBaseFor(StorageUrl const& url, OdString const& path, Content const& content);
    Freed reduceObject(StorageUrl const& url, OdString const& path);
    Freed replaceObject(
        StorageUrl const& url, Content const& content, std::optional<KnownContent> const& base, Effort effort);

    common::RootPath root_;
    Versions versions_;
    unsigned segmentLog_;
    StorageLayout layout_;
    Batch batch_;
    mutable ContentReader reader_; // remembers contents
    ContentWriter writer_;
    std::optional<ObjectBases> bases_; // while objects are turned over
};

} // namespace tav
