#include "host/checkout/removed_files.h"

#include "host/changes/digest.h"
#include "host/errors/failure.h"
#include "host/storage/files.h"
#include "host/storage/storage_error.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <string_view>
#include <system_error>

namespace tav {

namespace {

namespace fs = std::filesystem;

bool isOfRemoval(std::string_view name)
{
    constexpr std::string_view kStart = "removed-";
    return name.substr(0, kStart.size()) == kStart && name.size() > kStart.size() &&
           name.find_first_not_of("0123456789", kStart.size()) == std::string_view::npos;
}

std::vector<std::string> filesOfRemovals(common::RootPath const& root)
{
    std::string const folder = root.tavPath().ansi_str();
    std::vector<std::string> files;
    try {
        for (std::string const& name :
             entriesOf(folder)) { // The standard iterator ends the process for lack of memory.
            if (isOfRemoval(name)) {
                files.push_back(std::string(folder).append("/").append(name));
            }
        }
    } catch (StorageError const& error) {
        throw Failure(error.what, "Check your permissions for it.");
    }
    return files;
}

/// Whether the content of `file` is stored: stored again where it is damaged.
bool isStored(
    std::string const& file, common::RootPath const& root, std::vector<OdString> const& urls, LocalStorage& storage)
{
    std::error_code error;
    bool const isFile = fs::symlink_status(file, error).type() == fs::file_type::regular;
    auto const digest = isFile ? fileDigest(fromUtf8(file)) : std::nullopt;
    OdString const path = fromUtf8(file.substr(root.path().ansi_str().size() + 1));
    return digest && std::any_of(urls.begin(), urls.end(), [&](OdString const& url) {
               return digestOf(url) == digest && storage.repair(url, path).hasValue();
           });
}

} // namespace

RemovedFiles cleanRemovedFiles(common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage)
{
    RemovedFiles cleaned;
    std::vector<OdString> const urls = database.commits().urls();
    for (std::string const& file : filesOfRemovals(root)) {
        if (!isStored(file, root, urls, storage)) {
            cleaned.kept.push_back(file);
            continue;
        }
        std::error_code error;
        std::uintmax_t const length = fs::file_size(file, error);
        if (std::error_code const hindrance = os::removeFile(file)) {
            throw Failure("'" + file + "' cannot be removed: " + hindrance.message() + ".", "Delete it yourself.");
        }
        ++cleaned.freed.contents;
        cleaned.freed.bytes += error ? 0 : length;
    }
    return cleaned;
}

} // namespace tav
