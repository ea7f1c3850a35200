#include "host/commits/commit.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/text/wide.h"
#include "host/user_folders.h"

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
bool isRepeated(CommitOrder const& order, Work const& work)
{
    return work.finished() && work.finished()->message == order.message && work.finished()->author == order.author;
}

} // namespace

void makeCommit(CommitOptions const& options)
{
    CommitOrder const order{
        wide(options.author.empty() ? userName() : options.author), wide(options.message), missingFilesOf(options)};
    checkText(options.message, "message");
    checkText(order.author.ansi_str(), "author");
    Work work(openRepository(""), "commit");
    work.failIfBetweenCommits();
    if (isRepeated(order, work)) {
        printCommit(*work.finished(), "Completed");
        return;
    }
    Committed const committed = commit(work.root(), work.database(), order, work.start());
    printCommit(committed.commit, committed.isNew ? "Made" : "Nothing has changed since");
}

} // namespace tav
