#include "host/commits/commit.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"
#include "host/user/user_folders.h"

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
    CommitOrder const order{
        fromUtf8(options.author.empty() ? userName() : options.author), fromUtf8(options.message),
        missingFilesOf(options)};
    checkText(options.message, "message");
    checkText(order.author.ansi_str(), "author");
    WriteSession session(openRepository(""), "commit");
    session.failIfBetweenCommits();
    if (isRepeated(order, session)) {
        printCommit(*session.recoveredCommit(), "Completed");
        return;
    }
    Committed const committed = commit(session.root(), session.database(), order, session.start());
    printCommit(committed.commit, committed.isNew ? "Made" : "Nothing has changed since");
}

} // namespace tav
