/// Where the storage keeps its files (docs/formats/storage.md).
#pragma once

#include "host/storage/storage_url.h"
#include "host/text/digest.h"

#include "common/mu_common_repo_prop.h"

#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// Paths in bytes, inside ".tav" of one repository. Does not access the disk.
class StorageLayout {
public:
    explicit StorageLayout(common::RootPath const& root);

    /// ".tav" itself: large intermediate contents are in unnamed files there.
    std::string const& scratchFolder() const { return tavFolder_; }
    std::string const& storeFolder() const { return storeFolder_; }
    std::string const& objectFolder() const { return objectFolder_; }
    /// Where objects are written; they move to `objectFolder` when they are flushed.
    std::string const& incomingFolder() const { return incomingFolder_; }
    /// Where files on their way into the working folder are written.
    std::string const& restoringFolder() const { return restoringFolder_; }

    /// The file that has the content at `url`: a revision store or an object.
    std::string fileOf(StorageUrl const& url) const;
    /// The file of an object until it is flushed.
    std::string incomingFileOf(Digest const& digest) const;

    /// The NAME of the revision store in the file `name` of `storeFolder`; none when it is another file.
    static std::optional<std::string> storeIn(std::string_view name);
    /// Whether the file `name` of `storeFolder` is a store that was being rewritten.
    static bool isNewForm(std::string_view name);
    /// The file to which a store in the file `path` is rewritten.
    static std::string newFormOf(std::string const& path);

private:
    std::string tavFolder_;
    std::string storeFolder_;
    std::string objectFolder_;
    std::string incomingFolder_;
    std::string restoringFolder_;
};

/// What messages call the revision store with the NAME `store`.
std::string nameOfStore(std::string const& store);

} // namespace tav
