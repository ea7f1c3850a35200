#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/client/history.h"
#include "host/client/resend.h"
#include "host/errors/failure.h"
#include "host/repository/identity.h"
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
        return "It lacks " + countedThatAre(comparison.unknownThere, "commit") +
               " known here. 'tav server --send' sends them.\n";
    }
    if (comparison.unknownHere > 0) {
        return "It has " + countedThatAre(comparison.unknownHere, "commit") +
               " not known here. 'tav fetch' gets them.\n";
    }
    return "It has exactly the commits known here.\n";
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
            "The server in '" + server.ansi_str() + "' lacks " + countedThatAre(missing, "commit") + " known here.",
            "Add --send to send them there.");
    }
}

bool hasRepository(OdString const& server, OdString const& repository)
{
    std::vector<OdString> const there = repositoriesIn(server);
    return std::find(there.begin(), there.end(), repository) != there.end();
}

/// The repository of the server that has the most of the commits that are known here; empty when none has any. It may
/// have got another identifier while this folder had another server.
OdString repositoryWithHistory(LocalDatabase const& database, OdString const& server)
{
    OdString best;
    std::size_t fewest = database.commits().numbersFrom(1).size();
    for (OdString const& repository : repositoriesIn(server)) {
        Connection connection(server, repository);
        std::size_t const missing = missingThere(database, connection).size();
        if (missing < fewest) {
            best = repository;
            fewest = missing;
        }
    }
    return best;
}

/// Makes the repository on a server that has none. A server is made only in a folder that the user named just now: the
/// drive of the other may be off.
void requireRepository(WriteSession& session, OdString const& server, ServerOptions const& options)
{
    LocalDatabase& database = session.database();
    bool const isToBeMade = !options.folder.empty() && !std::filesystem::exists((server + L"/server.db").ansi_str());
    if (!isToBeMade && hasRepository(server, database.repositoryId())) {
        return;
    }
    OdString const there = isToBeMade ? OdString() : repositoryWithHistory(database, server);
    std::string const name = std::filesystem::absolute(session.root().path().ansi_str()).filename().string();
    OdString const id = there.isEmpty() ? makeRepository(server, name, database.repositoryId()) : there;
    addIdentity(session.root(), id);
    database.setServer(server, id);
    addProject(session.root().path(), fromUtf8(name), database.repositoryId());
}

/// A branch end that no name leads to any more would be as good as lost.
void noteGivenUp(std::vector<common::Reference> const& references, CommitTables const& commits)
{
    for (common::Reference const& reference : references) {
        auto const commit = commits.find(reference.commitHash);
        std::string const number = std::to_string(commit ? commit->number : 0);
        std::string const name = "'" + reference.name.ansi_str() + "'";
        printNote(
            reference.type == common::EType::branch
                ? "The server's " + name + " does not follow yours. Yours ends at commit " + number +
                      "; run 'tav branch NAME " + number + "' to keep it."
                : "The server's " + name + " is not yours. Yours is at commit " + number + "; run 'tav tag NAME " +
                      number + "' to keep it.");
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
        Sent const sent = sendAgain(session.root(), database, connection);
        report("Sent " + counted(sent.commits, "commit") + ".\n");
        noteGivenUp(sent.givenUp, database.commits());
    } else {
        fetchHistory(session.root(), database, connection, Compared::everything);
    }
    report("The history is kept in '" + shown(folder) + "' now.\n");
}

} // namespace tav
