#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/client/history.h"
#include "host/client/resend.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"
#include "host/user/projects.h"

#include <algorithm>
#include <filesystem>
#include <string>

namespace tav {

namespace {

std::string described(HistoryComparison const& comparison)
{
    if (comparison.unknownThere > 0) {
        return "It lacks " + counted(comparison.unknownThere, "commit") +
               " that are known here. 'tav server --send' sends them.\n";
    }
    if (comparison.unknownHere > 0) {
        return "It has " + counted(comparison.unknownHere, "commit") +
               " that are not known here. 'tav fetch' learns them.\n";
    }
    return "It has the commits that are known here, and no other.\n";
}

void showServer()
{
    LocalDatabase const database = LocalDatabase::open(openRepository(""));
    requireServer(database);
    print(
        "The history is kept in '" + shown(database.serverFolder()) + "', as the repository " +
        shown(database.repositoryId()) + ".\n");
    Connection connection(database);
    print(described(compareHistory(database, connection)));
}

/// Throws `Failure` unless the server has all that is known here: another one would hide it.
void requireHistory(LocalDatabase const& database, OdString const& server)
{
    Connection connection(server, database.repositoryId());
    if (std::size_t const missing = compareHistory(database, connection).unknownThere) {
        throw Failure(
            "The server in '" + server.ansi_str() + "' lacks " + counted(missing, "commit") + " that are known here.",
            "Add --send to send them there.");
    }
}

bool hasRepository(OdString const& server, OdString const& repository)
{
    std::vector<OdString> const there = repositoriesIn(server);
    return std::find(there.begin(), there.end(), repository) != there.end();
}

/// Makes the repository on a server that has none. A server is made only in a folder that the user named just now: the
/// drive of the other may be off.
void requireRepository(WriteSession& session, OdString const& server, ServerOptions const& options)
{
    LocalDatabase& database = session.database();
    bool const isToBeMade = !options.folder.empty() && !std::filesystem::exists((server + L"/server.db").ansi_str());
    if (isToBeMade || !hasRepository(server, database.repositoryId())) {
        std::string const name = std::filesystem::absolute(session.root().path().ansi_str()).filename().string();
        database.setServer(server, makeRepository(server, name));
        addProject(session.root().path(), fromUtf8(name), database.repositoryId());
    }
}

} // namespace

void server(ServerOptions const& options)
{
    if (options.folder.empty() && !options.send) {
        return showServer();
    }
    WriteSession session(openRepository(""), "server", Recovery::skipped);
    LocalDatabase& database = session.database();
    requireServer(database);
    OdString const folder = options.folder.empty() ? database.serverFolder() : namedServerFolder(options.folder);
    failIfInside(folder, session.root().path().ansi_str());
    if (options.send) {
        requireRepository(session, folder, options);
    } else {
        requireHistory(database, folder);
    }
    database.setServer(folder, database.repositoryId());
    Connection connection(database);
    if (options.send) {
        print("Sent " + counted(sendAgain(session.root(), database, connection), "commit") + ".\n");
    } else {
        fetchHistory(session.root(), database, connection, Compared::everything);
    }
    print("The history is kept in '" + shown(folder) + "' now.\n");
}

} // namespace tav
