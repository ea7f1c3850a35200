/// What was stored since the last flush: either all of it becomes safe on the disk, or all of it is removed again.
#pragma once

#include "host/text/digest.h"

#include "platform/os/os_open_file.h"

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>

namespace tav {

/// Files are named by their full paths in bytes. What is recorded here is on the disk already, or about to be. All
/// operations throw `StorageError` unless they say otherwise.
class Batch {
public:
    Batch() = default;
    Batch(Batch const&) = delete;
    Batch& operator=(Batch const&) = delete;
    /// Removes what was not flushed.
    ~Batch() { takeBack(); }

    /// To be called before anything is written to the file system of `folder`: `flush` reports disk errors from here
    /// on.
    void watch(std::string const& folder);

    /// Records that the object `path` has been written to the file `incoming`. `replaces` says that there is a damaged
    /// one at `path`, which stays until the flush, and permanently if that fails.
    void addObject(std::string const& path, std::string const& incoming, bool replaces);
    /// Records that the revision store `path`, now `length` bytes long, is about to grow; 0 when it is new. Only the
    /// first call for a store counts.
    void addStore(std::string const& path, std::uint64_t length);
    /// Forgets a store that has been removed again.
    void forgetStore(std::string const& path);
    /// Records that the entries of the folder `path` must be flushed.
    void addFolder(std::string const& path);
    /// Records that `url` names the content `digest`.
    void addUrl(Digest const& digest, OdString const& url);

    /// Where the object or store `path` can be read: an object that is not flushed is elsewhere.
    std::string const& readableFile(std::string const& path) const;
    /// The URL that was recorded for the content `digest`.
    std::optional<OdString> urlOf(Digest const& digest) const;

    /// Waits until all of it is safe on the disk, with one flush, and renames objects to their final names. The batch
    /// is then empty. After an error all of it has been removed.
    void flush();
    /// Empties the batch: removes objects and new stores, and truncates other stores to their former length.
    void takeBack() noexcept;

private:
    struct Object {
        std::string incoming;
        bool replaces = false;
    };
    struct Notes {
        std::map<Digest, OdString> urls;
        std::map<std::string, Object> objects;             // by final path
        std::map<std::string, std::uint64_t> storeLengths; // before the first append
        std::set<std::string> folders;
        os::OpenFile fileSystem;
    };

    void flushContents() const;

    Notes notes_;
};

} // namespace tav
