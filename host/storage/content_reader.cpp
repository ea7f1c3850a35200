#include "host/storage/content_reader.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"

#include "platform/os/os_open_file.h"

namespace tav {

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

bool ContentReader::isReadable(StorageUrl const& url)
{
    try {
        read(url, [](std::string_view) {});
        return true;
    } catch (StorageError const&) {
        return false;
    }
}

Link ContentReader::find(StorageUrl const& url) const
{
    return findIn(fileOf(url), url, quoted(url.text()));
}

Link ContentReader::findIn(std::string const& path, StorageUrl const& url, std::string const& name) const
{
    if (!exists(path)) {
        throw StorageError(name + " is not in the storage.");
    }
    auto const file = std::make_shared<RecordFile const>(RecordFile::openForReading(path, "The content of " + name));
    if (auto const index = file->find(url.digest)) {
        return {file, *index};
    }
    if (url.isObject()) {
        file->failAsDamaged();
    }
    throw StorageError(name + " is not in the storage.");
}

FindBase ContentReader::basesOf(StorageUrl const& url, Link const& link) const
{
    if (!url.isObject()) {
        return basesIn(link.file);
    }
    return [this, top = quoted(url.text())](Digest const& digest) {
        StorageUrl const base{{}, digest};
        return findIn(fileOf(base), base, quoted(base.text()) + ", which " + top + " builds on,");
    };
}

std::vector<Link> ContentReader::chainTo(StorageUrl const& url) const
{
    Link const link = find(url);
    return chainOf(link, basesOf(url, link));
}

void ContentReader::read(StorageUrl const& url, Sink const& sink)
{
    Link const link = find(url);
    contents_.read(link, basesOf(url, link), sink);
}

void ContentReader::readObjectIn(std::string const& path, StorageUrl const& url)
{
    Link const link = findIn(path, url, quoted(url.text()));
    contents_.read(link, basesOf(url, link), [](std::string_view) {});
}

void ContentReader::extract(StorageUrl const& url, std::string const& path)
{
    Link const link = find(url);
    os::OpenFile file;
    check(file.create(path, 0666), "'" + path + "' cannot be made");
    std::uint64_t offset = 0;
    try {
        contents_.read(link, basesOf(url, link), [&](std::string_view piece) {
            check(file.writeAt(offset, piece), "'" + path + "' cannot be written");
            offset += piece.size();
        });
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(path);
        throw;
    }
}

std::shared_ptr<Content const> ContentReader::load(StorageUrl const& url)
{
    Link const link = find(url);
    return contents_.load(link, basesOf(url, link));
}

void ContentReader::remember(Digest const& digest, Content content)
{
    if (content.isInMemory() && content.length() <= kLongestRemembered) {
        contents_.remember(digest, std::make_shared<Content const>(std::move(content)));
    }
}

} // namespace tav
