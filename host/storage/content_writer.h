/// Writing contents to the places that their URLs name.
#pragma once

#include "host/storage/batch.h"
#include "host/storage/content_reader.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"

#include <cstddef>
#include <optional>

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

    /// Writes `content` to `url` unless it can be read there. A revision builds on the one with the digest `previous`
    /// of its store, or else on the newest, if that makes it smaller. The reader then keeps that base, because reading
    /// the revision back needs it again.
    void write(StorageUrl const& url, Content const& content, Digest const& previous);

private:
    void writeObject(StorageUrl const& url, Content const& content);
    void writeRevision(StorageUrl const& url, Content const& content, Digest const& previous);
    void append(StorageUrl const& url, Content const& content, Digest const& previous, RecordFile& store);
    std::optional<KnownContent> loadBase(RecordFile const& store, Digest const& previous) const;

    StorageLayout const& layout_;
    Batch& batch_;
    ContentReader& reader_;
    unsigned segmentLog_;
};

} // namespace tav
