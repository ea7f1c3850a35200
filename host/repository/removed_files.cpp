#include "host/repository/removed_files.h"

#include "host/failure.h"
#include "host/repository/digest.h"
#include "host/text/wide.h"

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
    std::vector<std::string> files;
    std::error_code error;
    for (fs::directory_iterator entry(root.tavPath().ansi_str(), error), end; !error && entry != end;
         entry.increment(error)) {
        if (isOfRemoval(entry->path().filename().string())) {
            files.push_back(entry->path().string());
        }
    }
    if (error) {
        throw Failure(
            "'" + root.tavPath().ansi_str() + "' cannot be read: " + error.message() + ".", "Check your rights to it.");
    }
    std::sort(files.begin(), files.end());
    return files;
}

bool isStored(
    std::string const& file, common::RootPath const& root, std::vector<OdString> const& urls, LocalStorage& storage)
{
    std::error_code error;
    bool const isFile = fs::symlink_status(file, error).type() == fs::file_type::regular;
    auto const digest = isFile ? fileDigest(wide(file)) : std::nullopt;
    return digest && std::any_of(urls.begin(), urls.end(), [&](OdString const& url) {
               return digestOf(url) == digest && storage.verify(root, url).hasValue();
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
