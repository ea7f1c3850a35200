#include "host/repository/names.h"

#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include <filesystem>
#include <regex>
#include <utility>

namespace tav {

namespace {

namespace fs = std::filesystem;

/// Without "." and "..", and without a separator at the end.
fs::path normalized(fs::path const& path)
{
    fs::path const normal = fs::absolute(path).lexically_normal();
    return normal.has_filename() ? normal : normal.parent_path();
}

Failure noExpression(std::string const& name)
{
    return Failure(
        "No file is named '" + name + "', and it is not a valid expression.",
        "Type the path of a file as 'tav status' shows it.");
}

/// The explorer takes removed files for no candidates, so each file stands among the new ones here.
common::RepoChanges asChanges(std::vector<common::StagedFile> const& staged)
{
    common::RepoChanges changes;
    for (common::StagedFile const& file : staged) {
        changes.untracked.push_back({nullptr, {file.path}, 0});
    }
    return changes;
}

} // namespace

OdString pathInRepository(common::RootPath const& root, std::string const& typed)
{
    if (typed.empty()) {
        throw Failure("The name is empty.", "Type '.' for the folder that you are in.");
    }
    common::RootPath const absolute(fromUtf8(normalized((root.path() + L"/").ansi_str()).string()));
    OdString const path = fromUtf8(normalized(typed).string());
    if (path == absolute.path()) {
        return OdString::kEmpty;
    }
    auto const relative = absolute.relativePathTo(path);
    if (!relative.hasValue()) {
        throw Failure(
            "'" + typed + "' is not located in the current repository.",
            "Name a file below '" + absolute.path().ansi_str() + "'.");
    }
    return relative.value();
}

OdString findUnchanged(std::string const& name, common::RepoChanges const& changes, common::RootPath const& root)
{
    try {
        return common::RepoFileExplorer(changes, root).findUnchanged(fromUtf8(name));
    } catch (std::regex_error const&) {
        throw noExpression(name);
    }
}

NameFinder::NameFinder(common::RepoChanges const& changes, common::RootPath const& root)
    : root_(root)
    , explorer_(changes, root)
{
    for (auto const& file : changes.modified) {
        files_.emplace(file.working.path, common::FileChange::modified);
    }
    for (auto const& file : changes.untracked) {
        files_.emplace(file.working.path, common::FileChange::added);
    }
}

NameFinder::NameFinder(std::vector<common::StagedFile> const& staged, common::RootPath const& root)
    : root_(root)
    , explorer_(asChanges(staged), root)
{
    for (common::StagedFile const& file : staged) {
        files_.emplace(file.path, file.change);
    }
}

std::vector<common::StagedFile> NameFinder::find(std::string const& typed) const
{
    OdString const path = pathInRepository(root_, typed);
    auto const exact = files_.find(path);
    if (exact != files_.end()) {
        return {common::StagedFile(exact->first, exact->second)};
    }
    std::vector<common::StagedFile> inFolder = findInFolder(path);
    return inFolder.empty() ? findByExpression(fromUtf8(typed)) : inFolder;
}

std::vector<common::StagedFile> NameFinder::findInFolder(OdString const& folder) const
{
    OdString const prefix = folder.isEmpty() ? folder : folder + L"/";
    std::vector<common::StagedFile> found;
    for (auto file = files_.lower_bound(prefix); file != files_.end(); ++file) {
        if (file->first.left(prefix.getLength()) != prefix) {
            break;
        }
        found.emplace_back(file->first, file->second);
    }
    return found;
}

std::vector<common::StagedFile> NameFinder::findByExpression(OdString const& name) const
{
    try {
        auto const found = explorer_.findForStaging(name);
        if (auto const* const file = std::get_if<common::StagedFile>(&found)) {
            auto const match = files_.find(file->path);
            return {common::StagedFile(match->first, match->second)};
        }
        if (auto const* const error = std::get_if<ErrorMessage>(&found)) {
            Failure failure(*error, "Type more of the path of the one you mean:");
            std::regex const pattern = common::filePattern(name);
            for (auto const& [path, change] : files_) {
                if (std::regex_match(path.ansi_str(), pattern)) {
                    failure.details.push_back(path.ansi_str());
                }
            }
            throw failure;
        }
        return {};
    } catch (std::regex_error const&) {
        throw noExpression(name.ansi_str());
    }
}

} // namespace tav
