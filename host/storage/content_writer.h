/// Writing contents to the places that their URLs name.
#pragma once

#include "host/storage/batch.h"
#include "host/storage/content_reader.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"

#include <optional>
#include <string>

namespace tav {

/// Writes contents of one repository, and records in a batch what must be flushed. All operations throw `StorageError`,
/// and then leave nothing of the content behind.
class ContentWriter {
public:
    /// Keeps `layout`, `batch` and `reader` by address. Contents are compressed in segments of 2^`segmentLog` bytes.
    ContentWriter(StorageLayout const& layout, Batch& batch, ContentReader& reader, unsigned segmentLog)
        : layout_(layout)
        , batch_(batch)
        , reader_(reader)
        , segmentLog_(segmentLog)
    {
    }

    /// Writes `content` to `url` unless it can be read there. It builds on the content with the digest `base` if that
    /// makes it smaller. The base of a revision is in the same store, or else the newest one there is taken; the base
    /// of an object is another object, or all zeros for none.
    void write(StorageUrl const& url, Content const& content, Digest const& base);
    /// Writes the object to the new file `path`, on `base` if that makes it smaller.
    void writeObjectTo(
        std::string const& path, StorageUrl const& url, Content const& content, std::optional<KnownContent> const& base,
        Effort effort = Effort::quick) const;

private:
    void writeObject(StorageUrl const& url, Content const& content, Digest const& base);
    void writeRevision(StorageUrl const& url, Content const& content, Digest const& base);
    void append(StorageUrl const& url, Content const& content, Digest const& base, RecordFile& store);
    std::optional<KnownContent> loadBase(StorageUrl const& base) const;

    StorageLayout const& layout_;
    Batch& batch_;
    ContentReader& reader_;
    unsigned segmentLog_;
};

} // namespace tav
