#include "host/storage/content_reader.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"

#include "platform/os/os_open_file.h"

namespace tav {

namespace {

[[noreturn]] void throwMissing(StorageUrl const& url)
{
    throw StorageError(quoted(url.text()) + " is not in the storage.");
}

} // namespace

std::string ContentReader::fileOf(StorageUrl const& url) const
{
    return batch_.readableFile(layout_.fileOf(url));
}

bool ContentReader::isKept(StorageUrl const& url) const
{
    std::string const file = fileOf(url);
    if (url.isObject() || !exists(file)) {
        return exists(file);
    }
    return RecordFile::openForReading(file, "The store of " + quoted(url.text())).find(url.digest).has_value();
}

bool ContentReader::isReadable(StorageUrl const& url) const
{
    try {
        read(url, [](std::string_view) {});
        return true;
    } catch (StorageError const&) {
        return false;
    }
}

std::uint64_t ContentReader::lengthOf(StorageUrl const& url) const
{
    Found const found = find(url);
    return found.file.entries()[found.index].record.length;
}

void ContentReader::read(StorageUrl const& url, Sink const& sink) const
{
    Found const found = find(url);
    found.file.read(found.index, layout_.scratchFolder(), base(), sink);
}

void ContentReader::extract(StorageUrl const& url, std::string const& path) const
{
    Found const found = find(url);
    os::OpenFile file;
    check(file.create(path, 0666), "'" + path + "' cannot be made");
    std::uint64_t offset = 0;
    try {
        found.file.read(found.index, layout_.scratchFolder(), base(), [&](std::string_view piece) {
            check(file.writeAt(offset, piece), "'" + path + "' cannot be written");
            offset += piece.size();
        });
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(path);
        throw;
    }
}

ContentReader::Found ContentReader::find(StorageUrl const& url) const
{
    std::string const path = fileOf(url);
    if (!exists(path)) {
        throwMissing(url);
    }
    std::string const name = "The content of " + quoted(url.text());
    RecordFile file = RecordFile::openForReading(path, name);
    std::optional<std::size_t> const index = file.find(url.digest);
    if (index) {
        return {std::move(file), *index};
    }
    if (url.isObject()) {
        throw StorageError(name + " is damaged.");
    }
    throwMissing(url);
}

} // namespace tav
