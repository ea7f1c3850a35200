#include "host/changes/missing_files.h"

#include <filesystem>
#include <iterator>
#include <map>
#include <string>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr std::size_t kFew = 5;
constexpr std::size_t kMostLines = 20;

fs::path folderOf(OdString const& path)
{
    return fs::path(path.ansi_str()).parent_path();
}

/// Where a drive was mounted an empty folder stays.
bool isWholeFolderGone(fs::path const& folder, common::RootPath const& root)
{
    std::error_code error;
    fs::path const full = fs::path(root.path().ansi_str()) / folder;
    return !fs::is_directory(full, error) || (fs::is_empty(full, error) && !error);
}

/// The folders of `missing` that have nothing left, with the number of files that each has lost.
std::map<fs::path, std::size_t> goneFolders(std::vector<OdString> const& missing, common::RootPath const& root)
{
    std::map<fs::path, std::size_t> folders;
    for (OdString const& path : missing) {
        ++folders[folderOf(path)];
    }
    for (auto folder = folders.begin(); folder != folders.end();) {
        folder = isWholeFolderGone(folder->first, root) ? std::next(folder) : folders.erase(folder);
    }
    return folders;
}

} // namespace

bool mayBeMistake(std::vector<OdString> const& missing, common::RootPath const& root)
{
    return missing.size() > kFew || !goneFolders(missing, root).empty();
}

std::vector<std::string> missingLines(std::vector<OdString> const& missing, common::RootPath const& root)
{
    std::map<fs::path, std::size_t> const folders = goneFolders(missing, root);
    std::vector<std::string> lines;
    for (auto const& [folder, count] : folders) {
        lines.push_back(folder.string() + "/ (" + std::to_string(count) + (count == 1 ? " file)" : " files)"));
    }
    for (OdString const& path : missing) {
        if (folders.count(folderOf(path)) == 0) {
            lines.push_back(path.ansi_str());
        }
    }
    if (lines.size() > kMostLines) {
        std::size_t const more = lines.size() - kMostLines;
        lines.resize(kMostLines);
        lines.push_back("and " + std::to_string(more) + " more");
    }
    return lines;
}

} // namespace tav
