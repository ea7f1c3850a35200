#include "host/commits/commit.h"
#include "host/cli/commands.h"
#include "host/cli/current_settings.h"
#include "host/cli/output.h"
#include "host/cli/terminal.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include <string>

namespace tav {

namespace {

void checkText(std::string const& text, char const* what)
{
    bool const isBlank = text.find_first_not_of(" \t\r\n") == std::string::npos;
    if (isBlank) {
        throw Failure(std::string("The ") + what + " is empty.", "Say in a few words what has changed, and who did.");
    }
}

/// The first commit of a user is the time to learn the name; it is asked for once.
std::string askForName(std::string const& usual)
{
    auto const answer = ask("Your name for commits [" + usual + "]:");
    if (!answer) {
        return usual;
    }
    std::string const name = answer->empty() ? usual : *answer;
    saveSetting("user.name", name, Origin::user);
    return name;
}

std::string authorOf(CommitOptions const& options)
{
    if (!options.author.empty()) {
        return options.author;
    }
    SettingEntry const name = currentSettings().effective("user.name");
    return name.origin == Origin::standard && canAsk() ? askForName(name.value) : name.value;
}

void printCommit(CommitRecord const& commit, char const* verb)
{
    print(
        std::string(verb) + " commit " + std::to_string(commit.number) + " (" + commit.hash.left(12).ansi_str() +
        ").\n");
}

Missing missingFilesOf(CommitOptions const& options)
{
    return options.allRemoved       ? Missing::areAllRemoved
           : options.withoutRemoved ? Missing::areKept
                                    : Missing::areRemoved;
}

/// Whether the order is the one that was interrupted: repeating it makes no second commit.
bool isRepeated(CommitOrder const& order, WriteSession const& session)
{
    return session.recoveredCommit() && session.recoveredCommit()->message == order.message &&
           session.recoveredCommit()->author == order.author;
}

} // namespace

void makeCommit(CommitOptions const& options)
{
    common::RootPath const root = openRepository("");
    checkText(options.message, "message");
    CommitOrder const order{fromUtf8(authorOf(options)), fromUtf8(options.message), missingFilesOf(options)};
    checkText(order.author.ansi_str(), "author");
    WriteSession session(root, "commit");
    session.failIfBetweenCommits();
    if (isRepeated(order, session)) {
        printCommit(*session.recoveredCommit(), "Completed");
        return;
    }
    Committed const committed = commit(session.root(), session.database(), order, session.start());
    printCommit(committed.commit, committed.isNew ? "Made" : "Nothing has changed since");
}

} // namespace tav
