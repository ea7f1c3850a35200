#include "host/repository/commit.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/text/wide.h"
#include "host/user_folders.h"

#include <memory>
#include <string>

namespace tav {

namespace {

struct Options {
    std::string message;
    std::string author;
};

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

/// Whether the order is the one that was interrupted: repeating it makes no second commit.
bool isRepeated(CommitOrder const& order, Work const& work)
{
    return work.finished() && work.finished()->message == order.message && work.finished()->author == order.author;
}

void makeCommit(Options const& options)
{
    CommitOrder const order{wide(options.author.empty() ? userName() : options.author), wide(options.message)};
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

} // namespace

void addCommit(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("commit", "Keep what is staged, removed and renamed as a new commit");
    auto const options = std::make_shared<Options>();
    command->add_option("-m,--message", options->message, "What has changed, and why")->required();
    command->add_option("--author", options->author, "Who made it; by default your name and machine");
    command->callback([options] { makeCommit(*options); });
}

} // namespace tav
