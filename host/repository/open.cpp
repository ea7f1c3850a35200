#include "host/repository/open.h"

#include "host/failure.h"
#include "host/text/wide.h"

#include "platform/os/os_open_file.h"

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

void failIfLink(std::string const& path, std::string const& kind)
{
    std::error_code error;
    if (fs::is_symlink(fs::symlink_status(path, error))) {
        throw Failure(
            "'" + path + "' is a link, and may lead to another repository.",
            "Put the " + kind + " itself in its place.");
    }
}

} // namespace

common::RootPath openRepository(std::string const& folder)
{
    common::RootPath root = findRepository(folder);
    requireOwnFiles(root);
    return root;
}

void requireOwnFiles(common::RootPath const& root)
{
    for (wchar_t const* const name : {L".tav", L".tav/objects", L".tav/properties", L".tav/restoring", L".tav/tf"}) {
        failIfLink(root.pathTo(name).ansi_str(), "folder");
    }
    // A database that is in use has files beside it.
    for (wchar_t const* const name :
         {L".tav/tav.state", L".tav/tav.db", L".tav/tav.db-journal", L".tav/tav.db-shm", L".tav/tav.db-wal"}) {
        failIfLink(root.pathTo(name).ansi_str(), "file");
    }
    std::string const rules = root.pathTo(L".tav/properties/ignore").ansi_str();
    std::error_code error;
    fs::file_type const type = fs::status(rules, error).type();
    if (type != fs::file_type::not_found && type != fs::file_type::regular && type != fs::file_type::none) {
        throw Failure("'" + rules + "' is no file.", "Move it away; 'tav init' makes a new one.");
    }
    os::OpenFile probe;
    error = probe.openForReading(rules);
    bool const isMissing = error == std::errc::no_such_file_or_directory || error == std::errc::not_a_directory;
    if (error && !isMissing) {
        throw Failure("'" + rules + "' cannot be read: " + error.message() + ".", "Check your rights to it.");
    }
}

void requireOwnDatabase(common::RootPath const& root)
{
    std::string const database = root.dbPath().ansi_str();
    std::error_code error;
    if (fs::hard_link_count(database, error) > 1 && !error) {
        throw Failure(
            "'" + database + "' has another name (a hard link), and what is written would show there too.",
            "Put a copy in its place.");
    }
}

} // namespace tav
