#include "host/server/folder_contents.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <optional>
#include <set>
#include <utility>

namespace tav {

namespace {

constexpr std::int64_t kFolders = 100;

std::string nameOf(std::int64_t id)
{
    return "The content " + std::to_string(id) + " of the server";
}

std::string folderOfNumber(std::int64_t id)
{
    std::string const digits = std::to_string(id % kFolders);
    return digits.size() == 1 ? "0" + digits : digits;
}

/// Anything else in the folder is not ours.
std::optional<std::int64_t> numberOf(std::string const& name)
{
    std::int64_t id = 0;
    auto const end = std::from_chars(name.data(), name.data() + name.size(), id);
    return end.ec == std::errc() && std::to_string(id) == name ? std::optional(id) : std::nullopt;
}

os::OpenFile opened(std::string const& path, std::int64_t id)
{
    os::OpenFile file;
    check(file.openForReading(path), nameOf(id) + " cannot be opened");
    return file;
}

} // namespace

FolderContents::FolderContents(std::string folder) : folder_(std::move(folder)) {}

void FolderContents::put(OdString const& repository, std::vector<NewFile> const& files)
{
    std::set<std::string> folders;
    for (NewFile const& file : files) {
        std::string const folder = folderOf(repository) + "/" + folderOfNumber(file.id);
        if (folders.insert(folder).second && !exists(folder)) {
            makeFolders(folder);
            folders.insert({folderOf(repository), folder_});
        }
        std::string const path = fileOf(repository, file.id);
        check(os::renameUnflushed(file.path, path), "'" + path + "' cannot be made");
    }
    for (std::string const& folder : folders) {
        flushFolder(folder);
    }
}

std::uint64_t FolderContents::size(OdString const& repository, std::int64_t id)
{
    std::uint64_t length = 0;
    check(opened(fileOf(repository, id), id).length(length), nameOf(id) + " cannot be read");
    return length;
}

std::string FolderContents::read(OdString const& repository, std::int64_t id, std::uint64_t offset, std::size_t count)
{
    std::string bytes(count, '\0');
    std::size_t done = 0;
    check(opened(fileOf(repository, id), id).readAt(offset, bytes.data(), count, done), nameOf(id) + " cannot be read");
    bytes.resize(done);
    return bytes;
}

RecordFile FolderContents::open(OdString const& repository, std::int64_t id)
{
    return RecordFile::openForReading(fileOf(repository, id), nameOf(id));
}

std::vector<std::int64_t> FolderContents::list(OdString const& repository)
{
    std::vector<std::int64_t> ids;
    for (std::int64_t number = 0; number < kFolders; ++number) {
        for (std::string const& name : entriesOf(folderOf(repository) + "/" + folderOfNumber(number))) {
            auto const id = numberOf(name);
            if (id && *id % kFolders == number) {
                ids.push_back(*id);
            }
        }
    }
    std::sort(ids.begin(), ids.end());
    return ids;
}

void FolderContents::remove(OdString const& repository, std::int64_t id)
{
    std::error_code const error = os::removeUnflushed(fileOf(repository, id));
    if (error != std::errc::no_such_file_or_directory) {
        check(error, nameOf(id) + " cannot be removed");
    }
}

std::string FolderContents::folderOf(OdString const& repository) const
{
    return folder_ + "/" + repository.ansi_str();
}

std::string FolderContents::fileOf(OdString const& repository, std::int64_t id) const
{
    return folderOf(repository) + "/" + folderOfNumber(id) + "/" + std::to_string(id);
}

} // namespace tav
