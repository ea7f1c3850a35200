/// Reading contents by their URLs.
#pragma once

#include "host/storage/batch.h"
#include "host/storage/record_file.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// Reads the contents of one repository, including those of a batch that is not flushed. Everything throws
/// `StorageError`.
class ContentReader {
public:
    /// Keeps `layout` and `batch` by address.
    ContentReader(StorageLayout const& layout, Batch const& batch) : layout_(layout), batch_(batch) {}

    /// Whether the content is stored. An object counts as stored if its file exists.
    bool isKept(StorageUrl const& url) const;
    /// Whether the content is stored and intact. Reads it.
    bool isReadable(StorageUrl const& url) const;
    /// Length of the content in bytes, without unpacking it.
    std::uint64_t lengthOf(StorageUrl const& url) const;

    /// Passes the content to `sink`, and throws when its digest is wrong.
    void read(StorageUrl const& url, Sink const& sink) const;
    /// Writes the content into the new file `path`, and does not flush it. After an error there is no file, except one
    /// that was there before.
    void extract(StorageUrl const& url, std::string const& path) const;

    /// Keeps a content that the next ones to be read build on, so that it is not unpacked for each.
    void setBase(std::optional<KnownContent> base) { base_ = std::move(base); }
    KnownContent const* base() const { return base_ ? &*base_ : nullptr; }

private:
    struct Found {
        RecordFile file;
        std::size_t index;
    };

    std::string fileOf(StorageUrl const& url) const;
    Found find(StorageUrl const& url) const;

    StorageLayout const& layout_;
    Batch const& batch_;
    std::optional<KnownContent> base_;
};

} // namespace tav
