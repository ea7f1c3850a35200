#include "host/commits/commit.h"
#include "host/changes/status.h"
#include "host/cli/commands.h"
#include "host/cli/commit_author.h"
#include "host/cli/commit_message.h"
#include "host/cli/output.h"
#include "host/cli/status_lines.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

namespace {

void checkText(std::string const& text, char const* what)
{
    bool const isBlank = text.find_first_not_of(" \t\r\n") == std::string::npos;
    if (isBlank) {
        throw Failure(std::string("The ") + what + " is empty.", "Say what has changed, and who made the change.");
    }
}

using Replaced = std::optional<CommitRecord>;

Replaced replacedBy(CommitOptions const& options, common::RootPath const& root)
{
    if (!options.amends) {
        return std::nullopt;
    }
    LocalDatabase const database = LocalDatabase::open(root);
    Replaced commit = database.commits().find(database.currentCommit());
    if (!commit) {
        throw Failure("There is no commit yet that could be replaced.", "Make one with 'tav commit'.");
    }
    return commit;
}

std::string authorOf(CommitOptions const& options, Replaced const& replaced)
{
    if (!options.author.empty() || replaced) {
        return options.author.empty() ? replaced->author.ansi_str() : options.author;
    }
    return commitAuthor();
}

void printCommit(CommitRecord const& commit, char const* verb, Replaced const& replaced = {})
{
    report(
        std::string(verb) + " commit " + std::to_string(commit.number) + " (" + commit.hash.left(12).ansi_str() + ")" +
        (replaced ? ", which replaces commit " + std::to_string(replaced->number) : "") + ".\n");
}

Missing missingFilesOf(CommitOptions const& options)
{
    return options.allRemoved       ? Missing::areAllRemoved
           : options.withoutRemoved ? Missing::areKept
                                    : Missing::areRemoved;
}

std::vector<std::string> changesOf(Status const& status, bool takesModified)
{
    std::vector<std::string> lines;
    auto const add = [&](char const* label, std::vector<OdString> const& paths) {
        for (OdString const& path : paths) {
            lines.push_back(label + shown(path));
        }
    };
    for (StagedEntry const& entry : status.staged) {
        lines.push_back(lineOf(entry));
    }
    add("modified: ", takesModified ? status.modified : std::vector<OdString>());
    for (auto const& [path, previous] : status.renamed) {
        lines.push_back("renamed:  " + shown(previous) + " -> " + shown(path));
    }
    add("removed:  ", status.removed);
    return lines;
}

/// None where there is nothing to commit: then nobody needs to write.
std::optional<std::string>
messageOf(CommitOptions const& options, Replaced const& replaced, common::RootPath const& root)
{
    if (options.message) {
        return options.message;
    }
    if (!options.messageFile.empty()) {
        return readMessage(options.messageFile);
    }
    std::string const former = replaced ? replaced->message.ansi_str() : std::string();
    if (options.keepsMessage) {
        return former;
    }
    std::vector<std::string> const changes = changesOf(statusOf(root, false), options.takesModified);
    return changes.empty() && !replaced ? std::nullopt : std::optional(editMessage(root, changes, former));
}

bool isEdited(CommitOptions const& options)
{
    return !options.message && options.messageFile.empty() && !options.keepsMessage;
}

/// Whether the order is the one that was interrupted: repeating it makes no second commit.
bool isRepeated(CommitOrder const& order, WriteSession const& session)
{
    std::optional<CommitRecord> const& recovered = session.recoveredCommit();
    return recovered && recovered->message == order.message && recovered->author == order.author &&
           (!order.replaced || recovered->parents == order.replaced->parents);
}

void carryOut(CommitOrder const& order, common::RootPath const& root)
{
    WriteSession session(root, "commit", Recovery::required, Note::byCommand);
    if (isRepeated(order, session)) {
        printCommit(*session.recoveredCommit(), "Completed");
        return;
    }
    session.noteRecovery();
    session.failIfBetweenCommits();
    Committed const committed = commit(session.root(), session.database(), order, session.start());
    if (committed.isNew) {
        printCommit(committed.commit, "Made", order.replaced);
    } else {
        printCommit(committed.commit, "Nothing has changed since");
    }
}

} // namespace

void makeCommit(CommitOptions const& options)
{
    common::RootPath const root = openRepository("");
    Replaced const replaced = replacedBy(options, root);
    auto const message = messageOf(options, replaced, root);
    if (message) {
        checkText(*message, "message");
    }
    CommitOrder const order{
        fromUtf8(authorOf(options, replaced)), fromUtf8(message.value_or("")), missingFilesOf(options),
        options.takesModified, replaced};
    checkText(order.author.ansi_str(), "author");
    try {
        carryOut(order, root);
    } catch (Failure& failure) {
        if (message && isEdited(options)) {
            failure.details.push_back(
                std::string("Your message is kept: tav commit ") + (options.amends ? "--amend " : "") + "-F '" +
                messagePath(root) + "'");
        }
        throw;
    }
    if (isEdited(options)) {
        removeMessage(root);
    }
}

} // namespace tav
