#include "host/storage/batch.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"

namespace tav {

namespace {

// Up to here single flushes cost less than one of the whole file system, which others write to as well.
constexpr std::size_t kFewFiles = 8;

} // namespace

void Batch::watch(std::string const& folder)
{
    if (!notes_.fileSystem.isOpen()) {
        check(notes_.fileSystem.openFolder(folder), "'" + folder + "' cannot be opened");
    }
}

void Batch::addObject(std::string const& path, std::string const& incoming, bool replaces)
{
    notes_.objects[path] = {incoming, replaces};
}

void Batch::addStore(std::string const& path, std::uint64_t length)
{
    notes_.storeLengths.emplace(path, length);
}

void Batch::forgetStore(std::string const& path)
{
    notes_.storeLengths.erase(path);
}

void Batch::addFolder(std::string const& path)
{
    notes_.folders.insert(path);
}

void Batch::addUrl(Digest const& digest, OdString const& url)
{
    notes_.urls[digest] = url;
}

std::string const& Batch::readableFile(std::string const& path) const
{
    auto const object = notes_.objects.find(path);
    return object == notes_.objects.end() ? path : object->second.incoming;
}

std::optional<OdString> Batch::urlOf(Digest const& digest) const
{
    auto const stored = notes_.urls.find(digest);
    return stored == notes_.urls.end() ? std::nullopt : std::optional(stored->second);
}

void Batch::flush()
{
    try {
        flushContents();
        for (auto const& [path, object] : notes_.objects) {
            check(os::renameUnflushed(object.incoming, path), "'" + path + "' cannot be made");
        }
        for (std::string const& folder : notes_.folders) {
            flushFolder(folder);
        }
    } catch (...) {
        takeBack();
        throw;
    }
    notes_ = Notes();
}

void Batch::flushContents() const
{
    if (notes_.objects.size() + notes_.storeLengths.size() > kFewFiles) {
        std::error_code const error = notes_.fileSystem.flushFileSystem();
        if (error != std::errc::function_not_supported) {
            return check(error, "The storage cannot be written");
        }
    }
    for (auto const& [path, object] : notes_.objects) {
        flushFile(object.incoming);
    }
    for (auto const& [path, length] : notes_.storeLengths) {
        flushFile(path);
    }
}

// What cannot be taken back does no harm: torn tails and incoming objects are dropped later, whole ones found.
void Batch::takeBack() noexcept
{
    std::error_code ignored;
    for (auto const& [path, object] : notes_.objects) {
        ignored = os::removeUnflushed(object.incoming);
        if (!object.replaces) {
            ignored = os::removeUnflushed(path);
        }
    }
    for (auto const& [path, length] : notes_.storeLengths) {
        os::OpenFile store;
        if (length == 0) {
            ignored = os::removeUnflushed(path);
        } else if (!store.openForChanging(path)) {
            ignored = store.truncate(length);
        }
    }
    notes_ = Notes();
}

} // namespace tav
