#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/client/connection.h"
#include "host/client/rebuild.h"
#include "host/errors/failure.h"
#include "host/repository/identity.h"
#include "host/repository/ignore_file.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"
#include "host/user/projects.h"

#include <cstddef>
#include <filesystem>
#include <string>
#include <utility>

namespace tav {

namespace {

std::string absolute(std::string const& folder)
{
    std::filesystem::path const path = std::filesystem::absolute(folder).lexically_normal();
    return path.has_filename() ? path.string() : path.parent_path().string();
}

/// Of two repositories that have the same files, the outer one would commit what belongs to the inner one.
void failIfInRepository(std::string const& folder)
{
    std::filesystem::path place = std::filesystem::weakly_canonical(absolute(folder));
    while (place.has_relative_path()) {
        place = place.parent_path();
        if (common::RootPath::get(fromUtf8(place.string()), false).hasValue()) {
            throw Failure(
                "'" + folder + "' is inside of the repository in '" + place.string() + "', which keeps its files.",
                "Add --nested to make a repository of its own all the same.");
        }
    }
}

/// The folder that the user named; empty when there is none.
OdString namedServer(InitOptions const& options)
{
    if (options.server && options.server->empty()) {
        throw Failure("The name after --server is empty.", "Name the folder of the server.");
    }
    return options.server ? namedServerFolder(*options.server) : OdString();
}

OdString namedOrDefault(OdString const& server)
{
    return server.isEmpty() ? namedServerFolder(defaultServerFolder()) : server;
}

void chooseServer(WriteSession& session, OdString const& named, std::string const& folder, std::string const& name)
{
    LocalDatabase& database = session.database();
    if (database.repositoryId().isEmpty()) {
        OdString const chosen = namedOrDefault(named);
        failIfInside(chosen, folder);
        OdString const id = makeRepository(chosen, name);
        addIdentity(session.root(), id);
        database.setServer(chosen, id);
    } else if (!named.isEmpty() && database.serverFolder() != named) {
        throw Failure(
            "The repository has its server already, in '" + database.serverFolder().ansi_str() + "'.",
            "Run 'tav init' without --server, or 'tav server' to name another place.");
    }
}

/// The list of projects is a convenience: without it the repository is as good.
void enterProject(LocalDatabase const& database, std::string const& folder, std::string const& name)
{
    try {
        addProject(fromUtf8(folder), fromUtf8(name), database.repositoryId());
    } catch (Failure const& failure) {
        printNote("The repository is complete, but 'tav projects' does not know it: " + failure.what);
    }
}

/// Makes a lost database again, and says what the user should know of it.
std::string rebuilt(common::RootPath const& root, std::string const& folder, OdString const& named)
{
    OdString const server = namedOrDefault(named);
    Rebuilt const made = rebuildDatabase(root, fromUtf8(folder), {server, !named.isEmpty()});
    if (made.unknown > 0) {
        printNote(
            "The server in '" + server.ansi_str() + "' does not know " + std::to_string(made.unknown) +
            " of the versions that are here; 'tav gc' would remove them.");
    }
    std::string const place =
        made.base == 0 ? ""
                       : " The folder is assumed to be at commit " + std::to_string(made.base) + "; see 'tav status'.";
    return "Made the database again from the server, with " +
           counted(static_cast<std::size_t>(made.commits), "commit") + "." + place + "\n";
}

} // namespace

void init(InitOptions const& options)
{
    OdString const path = fromUtf8(options.folder);
    OdString const server = namedServer(options); // What is wrong with it is said before anything is made.
    bool const existed = common::RootPath::get(path, false).hasValue();
    if (!existed && !options.nested && !options.folder.empty()) {
        failIfInRepository(options.folder);
    }
    common::RootPath const root =
        valueOrFail(common::RootPath::get(path, true), "Check that the folder is one and that you may write there.");
    requireOwnFiles(root);
    std::string const folder = absolute(options.folder);
    std::string const name = std::filesystem::path(folder).filename().string();
    os::FileLock lock = lockRepository(root, "init");
    makeIgnoreFile(root);
    makeState(root);
    readState(root); // One that was there already may be damaged.
    std::string const found = LocalDatabase::isLost(root) ? rebuilt(root, folder, server) : std::string();
    LocalDatabase::make(root);
    WriteSession session(root, std::move(lock), Recovery::attempted);
    chooseServer(session, server, folder, name);
    enterProject(session.database(), folder, name);
    report(found);
    report(
        existed ? "The repository in '" + shown(path) + "' was there already; it is complete.\n"
                : "Made a repository in '" + shown(path) + "'.\n");
}

} // namespace tav
