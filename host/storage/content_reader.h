/// Reading contents by their URLs.
#pragma once

#include "host/storage/batch.h"
#include "host/storage/chain.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"

#include <cstdint>
#include <memory>
#include <string>
#include <utility>

namespace tav {

/// Reads the contents of one repository, including those of a batch that is not flushed. Everything throws
/// `StorageError`.
class ContentReader {
public:
    /// Keeps `layout` and `batch` by address.
    ContentReader(StorageLayout const& layout, Batch const& batch)
        : layout_(layout)
        , batch_(batch)
        , contents_(layout.scratchFolder())
    {
    }

    /// Whether the content is stored. An object counts as stored if its file exists.
    bool isKept(StorageUrl const& url) const;
    /// Whether the content is stored and intact. Reads it.
    bool isReadable(StorageUrl const& url);

    /// The record of the content.
    Link find(StorageUrl const& url) const;
    /// The records that lead to the content, its own first.
    std::vector<Link> chainTo(StorageUrl const& url) const;

    /// Passes the content to `sink`, and throws when its digest is wrong.
    void read(StorageUrl const& url, Sink const& sink);
    /// Writes the content into the new file `path`, and does not flush it. After an error there is no file, except one
    /// that was there before.
    void extract(StorageUrl const& url, std::string const& path);

    /// Reads the object at `url` from the file `path` instead of its own, and throws when its digest is wrong.
    void readObjectIn(std::string const& path, StorageUrl const& url);

    /// The content, for others to build on.
    std::shared_ptr<Content const> load(StorageUrl const& url);
    /// Remembers a content that those stored next may build on, so that it need not be read.
    void remember(Digest const& digest, Content content);

private:
    Link findIn(std::string const& path, StorageUrl const& url, std::string const& name) const;
    std::string fileOf(StorageUrl const& url) const;
    /// Where the bases of the content at `url` are, whose record is `link`.
    FindBase basesOf(StorageUrl const& url, Link const& link) const;

    StorageLayout const& layout_;
    Batch const& batch_;
    ChainReader contents_;
};

} // namespace tav
