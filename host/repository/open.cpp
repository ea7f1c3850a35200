#include "host/repository/open.h"

#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include <filesystem>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kHowToInit = "Run 'tav init' in the folder of your drawings to make it one.";

fs::path currentFolder()
{
    std::error_code error;
    fs::path current = fs::current_path(error);
    if (error) {
        throw Failure("The current folder no longer exists.", "Change to another folder and try again.");
    }
    return current;
}

/// The repository whose working folder is `start`, or a folder above it.
std::optional<common::RootPath> enclosingRepository(fs::path const& start)
{
    for (fs::path place = start;; place = place.parent_path()) {
        auto const found = common::RootPath::get(fromUtf8(place.string()), false);
        if (found.hasValue()) {
            return found.value();
        }
        if (place == place.parent_path()) {
            return std::nullopt;
        }
    }
}

common::RootPath findRepository(std::string const& folder)
{
    fs::path const start = folder.empty() ? currentFolder() : fs::path(folder);
    auto const found = folder.empty() ? enclosingRepository(start) : std::nullopt;
    return found ? *found : valueOrFail(common::RootPath::get(fromUtf8(start.string()), false), kHowToInit);
}

void failIfLink(std::string const& path, std::string const& kind)
{
    std::error_code error;
    if (fs::is_symlink(fs::symlink_status(path, error))) {
        throw Failure(
            "'" + path + "' is a link, and may lead to another repository.",
            "Put the " + kind + " itself in its place.");
    }
}

void failIfShared(std::string const& path)
{
    std::error_code error;
    bool const isFile = fs::is_regular_file(path, error);
    if (isFile && fs::hard_link_count(path, error) > 1 && !error) {
        throw Failure("'" + path + "' has another hard link, which would change too.", "Put a copy in its place.");
    }
}

} // namespace

common::RootPath openRepository(std::string const& folder)
{
    common::RootPath root = findRepository(folder);
    requireOwnFiles(root);
    return root;
}

std::optional<common::RootPath> repositoryHere()
{
    auto found = enclosingRepository(currentFolder());
    if (found) {
        requireOwnFiles(*found);
    }
    return found;
}

void requireOwnFiles(common::RootPath const& root)
{
    for (wchar_t const* const name :
         {L".tav", L".tav/conflict", L".tav/objects", L".tav/objects/incoming", L".tav/properties", L".tav/restoring",
          L".tav/tf"}) {
        failIfLink(root.pathTo(name).ansi_str(), "folder");
    }
    failIfLink(root.statePath().ansi_str(), "file");
    failIfLink(root.pathTo(L".tav/config").ansi_str(), "file");
    failIfLink(root.pathTo(L".tav/identity").ansi_str(), "file");
    failIfLink(root.pathTo(L".tav/properties/ignore").ansi_str(), "file");
    for (wchar_t const* const end : {L"", L"-journal", L"-shm", L"-wal"}) { // A database in use has files beside it.
        std::string const file = (root.dbPath() + end).ansi_str();
        failIfLink(file, "file");
        failIfShared(file);
    }
}

} // namespace tav
