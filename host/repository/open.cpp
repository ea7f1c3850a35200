#include "host/repository/open.h"

#include "host/failure.h"
#include "host/text/wide.h"

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
        throw Failure("The current folder does not exist any more.", "Change to another folder and try again.");
    }
    return current;
}

common::RootPath findRepository(std::string const& folder)
{
    if (!folder.empty()) {
        return valueOrFail(common::RootPath::get(wide(folder), false), kHowToInit);
    }
    fs::path const start = currentFolder();
    for (fs::path place = start;; place = place.parent_path()) {
        auto const found = common::RootPath::get(wide(place.string()), false);
        if (found.hasValue()) {
            return found.value();
        }
        if (place == place.parent_path()) {
            return valueOrFail(common::RootPath::get(wide(start.string()), false), kHowToInit);
        }
    }
}

} // namespace

common::RootPath openRepository(std::string const& folder)
{
    common::RootPath root = findRepository(folder);
    requireOwnFolders(root);
    return root;
}

void requireOwnFolders(common::RootPath const& root)
{
    for (wchar_t const* const name : {L".tav", L".tav/objects", L".tav/properties", L".tav/restoring", L".tav/tf"}) {
        std::string const folder = root.pathTo(name).ansi_str();
        std::error_code error;
        if (fs::is_symlink(fs::symlink_status(folder, error))) {
            throw Failure(
                "'" + folder + "' is a link, and may lead to another repository.",
                "Put the folder itself in its place.");
        }
    }
    std::string const rules = root.pathTo(L".tav/properties/ignore").ansi_str();
    std::error_code error;
    fs::file_type const type = fs::status(rules, error).type();
    if (type != fs::file_type::not_found && type != fs::file_type::regular && type != fs::file_type::none) {
        throw Failure("'" + rules + "' is no file.", "Move it away; 'tav init' makes a new one.");
    }
}

} // namespace tav
