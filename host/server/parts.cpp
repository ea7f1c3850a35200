#include "host/server/parts.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"

#include "platform/os/os_open_file.h"

#include <charconv>
#include <random>
#include <utility>

namespace tav {

namespace {

constexpr mode_t kPermissions = 0666;

std::string nameOf(std::int64_t upload)
{
    return "The upload " + std::to_string(upload);
}

std::uint64_t lengthOf(os::OpenFile const& file, std::int64_t upload)
{
    std::uint64_t length = 0;
    check(file.length(length), nameOf(upload) + " cannot be read");
    return length;
}

} // namespace

Parts::Parts(std::string folder) : folder_(std::move(folder)) {}

std::uint64_t Parts::begin(std::int64_t upload) const
{
    makeFolders(folder_);
    os::OpenFile file;
    std::error_code const error = file.create(fileOf(upload), kPermissions);
    if (error == std::errc::file_exists) {
        return length(upload);
    }
    check(error, nameOf(upload) + " cannot be made");
    return 0;
}

std::uint64_t Parts::length(std::int64_t upload) const
{
    os::OpenFile file;
    std::error_code const error = file.openForReading(fileOf(upload));
    if (error == std::errc::no_such_file_or_directory) {
        return 0;
    }
    check(error, nameOf(upload) + " cannot be opened");
    return lengthOf(file, upload);
}

void Parts::write(std::int64_t upload, std::uint64_t offset, std::string_view bytes) const
{
    os::OpenFile file;
    check(file.openForChanging(fileOf(upload)), nameOf(upload) + " cannot be opened");
    check(file.writeAt(offset, bytes), nameOf(upload) + " cannot be written");
}

// Two may finish one upload: each takes a file of its own.
std::string Parts::take(std::int64_t upload) const
{
    std::random_device random;
    std::string taken = fileOf(upload) + "." + std::to_string(random());
    check(os::renameUnflushed(fileOf(upload), taken), nameOf(upload) + " cannot be renamed");
    return taken;
}

void Parts::remove(std::int64_t upload) const
{
    std::error_code const error = os::removeUnflushed(fileOf(upload));
    if (error != std::errc::no_such_file_or_directory) {
        check(error, nameOf(upload) + " cannot be removed");
    }
}

void Parts::removeOthers(std::function<bool(std::int64_t)> const& isThere) const
{
    for (std::string const& name : entriesOf(folder_)) {
        std::int64_t upload = 0;
        std::from_chars(name.data(), name.data() + name.size(), upload);
        if (upload > 0 && !isThere(upload)) {
            [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(folder_ + "/" + name); // Next time.
        }
    }
}

std::string Parts::fileOf(std::int64_t upload) const
{
    return folder_ + "/" + std::to_string(upload);
}

} // namespace tav
