#include "host/repository/identity.h"

#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <sstream>
#include <string>
#include <system_error>

namespace tav {

namespace {

std::string pathOf(common::RootPath const& root)
{
    return root.tavPath().ansi_str() + "/identity";
}

/// Empty when there is none.
std::string textOf(std::string const& path)
{
    std::string text;
    std::error_code const error = os::readFile(path, text);
    if (error && error != std::errc::no_such_file_or_directory) {
        throw Failure(
            "'" + path + "' cannot be read: " + error.message() + ".", "Check it and your permissions for it.");
    }
    return error ? std::string() : text;
}

bool contains(std::vector<OdString> const& ids, OdString const& id)
{
    return std::find(ids.begin(), ids.end(), id) != ids.end();
}

} // namespace

std::vector<OdString> identities(common::RootPath const& root)
{
    std::vector<OdString> ids;
    std::istringstream lines(textOf(pathOf(root)));
    for (std::string line; std::getline(lines, line);) {
        ids.push_back(fromUtf8(line));
    }
    return ids;
}

void addIdentity(common::RootPath const& root, OdString const& id)
{
    if (contains(identities(root), id)) {
        return;
    }
    std::string const path = pathOf(root);
    if (std::error_code const error = os::replaceFile(path, textOf(path) + id.ansi_str() + "\n")) {
        throw Failure(
            "'" + path + "' cannot be written: " + error.message() + ".",
            "Check the free space and your permissions there.");
    }
}

void requireIdentity(common::RootPath const& root, OdString const& id)
{
    std::vector<OdString> const ids = identities(root);
    if (!id.isEmpty() && !ids.empty() && !contains(ids, id)) {
        throw Failure(
            "The database '" + root.dbPath().ansi_str() + "' belongs to another repository.",
            "Put the right one in its place, or move it away and run 'tav init', which makes it again from the "
            "server.");
    }
}

} // namespace tav
