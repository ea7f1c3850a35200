/// What a server's store of contents has to do. The core knows no other way to it.
///
/// A content is one record file, which never changes (docs/formats/storage.md). Its number is used once only, so that
/// removing a file cannot hit a newer one. Every operation throws `StorageError`. One thread for each object; other
/// programs may use the same store through objects of their own.
#pragma once

#include "host/storage/record_file.h"

#include "platform/sdk/OdString.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tav {

/// A file that is to become a content.
struct NewFile {
    std::int64_t id = 0;
    std::string path;
};

class ContentStore {
public:
    ContentStore() = default;
    ContentStore(ContentStore const&) = delete;
    ContentStore& operator=(ContentStore const&) = delete;
    virtual ~ContentStore() = default;

    /// Takes files over, whose bytes are safe on the disk, as the files of a repository; they are safe when this
    /// returns. There is no file of such a number, or one with the same bytes that an interrupted call has left.
    virtual void put(OdString const& repository, std::vector<NewFile> const& files) = 0;

    /// Length in bytes. The code of the error is ENOENT when there is no such file.
    virtual std::uint64_t size(OdString const& repository, std::int64_t id) = 0;
    /// The bytes from `offset` on: `count` of them, or fewer where the file ends.
    virtual std::string read(OdString const& repository, std::int64_t id, std::uint64_t offset, std::size_t count) = 0;
    /// The file, opened to be unpacked.
    virtual RecordFile open(OdString const& repository, std::int64_t id) = 0;

    /// The numbers of all files of a repository in ascending order.
    virtual std::vector<std::int64_t> list(OdString const& repository) = 0;
    /// It is no error when there is no such file.
    virtual void remove(OdString const& repository, std::int64_t id) = 0;
};

} // namespace tav
