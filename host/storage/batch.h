/// What was stored since the last flush: all of it becomes safe on the disk, or all of it goes again.
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

/// Files are named by their full paths in bytes. What is noted here is on the disk already, or about to be. Unless it
/// says otherwise, everything throws `StorageError`.
class Batch {
public:
    Batch() = default;
    Batch(Batch const&) = delete;
    Batch& operator=(Batch const&) = delete;
    /// Takes back what was not flushed.
    ~Batch() { takeBack(); }

    /// Before anything is written to the file system of `folder`: what fails on the disk from here on is seen by
    /// `flush`.
    void watch(std::string const& folder);

    /// Notes that the object `path` has been written to the file `incoming`. `replaces` tells that there is a damaged
    /// one at `path`, which then stays until the flush, and for good when that fails.
    void addObject(std::string const& path, std::string const& incoming, bool replaces);
    /// Notes that the revision store `path`, now `length` bytes long, is about to grow; 0 when it is new. Only the
    /// first note of a store counts.
    void addStore(std::string const& path, std::uint64_t length);
    /// Forgets a store that has been removed again.
    void forgetStore(std::string const& path);
    /// Notes that entries of the folder `path` have to be flushed.
    void addFolder(std::string const& path);
    /// Notes that `url` names the content `digest`.
    void addUrl(Digest const& digest, OdString const& url);

    /// Where the object or store `path` can be read: an object that is not flushed is elsewhere.
    std::string const& readableFile(std::string const& path) const;
    /// The URL that was noted for the content `digest`.
    std::optional<OdString> urlOf(Digest const& digest) const;

    /// Waits until all of it is safe, in one go, and gives objects their names. The batch is empty then. After an error
    /// all of it has been taken back.
    void flush();
    /// Empties the batch: removes objects and new stores, and cuts other stores to their former length.
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
