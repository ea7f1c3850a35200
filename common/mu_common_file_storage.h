/// Storage URLs, and the interface of the storage that keeps the contents of all versions.
///
/// A URL that begins with "tf" names a revision of a drawing, "tf:NAME#REVISION"; one that begins with "po" names
/// another file by the content hash in its last 64 characters. The meaning of the rest of a URL is up to the storage
/// that made it. The functions keep no state; any thread may call them.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_io_utils.h"
#include "common/mu_common_repo_prop.h"

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <vector>

namespace common {

/// Where a content is kept.
enum class StorageType : std::int32_t {
    Tf = 0,     ///< in the revision store of a drawing
    Object = 1, ///< as an object of its own
};

/// The kind of storage that `url` names: `Tf` when it begins with "tf" (case-sensitive), else `Object`.
MU_COMMON_EXPORT StorageType urlToType(OdString const& url);
/// The kind of storage that the file `path` belongs to: `Tf` when its extension is "dwg" (case-sensitive), else
/// `Object`.
MU_COMMON_EXPORT StorageType fileToType(OdString const& path);

/// The revision that `url` names: what follows the last '#' of a "tf" URL, the last 64 characters of a "po" URL.
/// Error: any other beginning, a "tf" URL without '#' or with a line end.
MU_COMMON_EXPORT Expected<OdString> getRevision(OdString const& url);

/// Full path of the revision store or object that `url` names, inside ".tav" of `root`: the name of a store is the text
/// between "tf:" and the first '#'. Does not access the disk and does not check the name: a caller that gets URLs from
/// others must check it first.
/// Error: any other beginning, a "tf" URL without ':' after "tf", without '#' or with a line end.
MU_COMMON_EXPORT Expected<OdString> getStoragePath(RootPath const& root, OdString const& url);

/// What the host implements to keep contents. `root` is the repository; URLs are those that `store` has returned.
class MU_COMMON_EXPORT FileStorage {
public:
    FileStorage() = default;
    FileStorage(FileStorage const&) = delete;
    FileStorage& operator=(FileStorage const&) = delete;
    virtual ~FileStorage();

    /// Keeps the content of the working file `path` and returns its URL.
    virtual Expected<OdString> store(RootPath const& root, OdString const& path) = 0;
    /// Writes the content that `url` names into the working file `target`.
    virtual WriteOutcome restore(RootPath const& root, OdString const& url, OdString const& target) = 0;
    /// Whether the content that `url` names is kept.
    virtual Expected<bool> contains(RootPath const& root, OdString const& url) = 0;

    /// Merges through `mergeFromStorage`, given `fourth` and `second`, if the host accepts `first`; when the host
    /// declines, the result is success at once. `third` is not used. Errors: that of `mergeFromStorage`, unchanged;
    /// `second` is not in the storage.
    virtual WriteOutcome merge(
        OdString const& first, OdString const& second, OdString const& third, OdString fourth, RootPath const& root,
        IoInterface const& io);

    /// Removes the content that `url` names.
    virtual WriteOutcome remove(RootPath const& root, OdString const& url) = 0;
    /// Merges the stored version `url` into `target`. True when it was merged, false when the version is not in the
    /// storage.
    virtual Expected<bool> mergeFromStorage(RootPath const& root, OdString const& target, OdString const& url) = 0;
    /// The URLs of all revisions in the same store as the one that `url` names, oldest first.
    virtual Expected<std::vector<OdString>> revisions(RootPath const& root, OdString const& url) = 0;
    /// Checks that the content that `url` names is stored and intact.
    virtual WriteOutcome verify(RootPath const& root, OdString const& url) = 0;
};

} // namespace common
