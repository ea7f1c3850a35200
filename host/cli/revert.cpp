#include "host/changes/changes.h"
#include "host/changes/staging.h"
#include "host/checkout/permissions.h"
#include "host/checkout/present_contents.h"
#include "host/cli/commands.h"
#include "host/cli/commit_author.h"
#include "host/cli/output.h"
#include "host/commits/commit.h"
#include "host/commits/commit_names.h"
#include "host/commits/opposite.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <string>
#include <vector>

namespace tav {

namespace {

std::string messageFor(CommitRecord const& commit, RevertOptions const& options)
{
    std::string const message = commit.message.ansi_str();
    return options.message.value_or(
        "Revert commit " + std::to_string(commit.number) + ": \"" + message.substr(0, message.find('\n')) + "\"");
}

/// The paths of `opposite` for which anything else is staged than what it stages itself.
std::set<OdString> stagedOtherwise(Opposite const& opposite, common::State const& state)
{
    std::set<OdString> const paths = opposite.paths();
    std::set<OdString> found;
    for (common::StagedFile const& file : state.stagedFiles) {
        bool const isOurs = std::find(opposite.staged.begin(), opposite.staged.end(), file) != opposite.staged.end();
        if (paths.count(file.path) > 0 && !isOurs) {
            found.insert(file.path);
        }
    }
    for (auto const& [path, previous] : state.renames) {
        auto const own = opposite.renames.find(path);
        bool const isOurs = own != opposite.renames.end() && own->second == previous;
        if ((paths.count(path) > 0 || paths.count(previous) > 0) && !isOurs) {
            found.insert(path);
        }
    }
    return found;
}

void requireUntouched(common::RootPath const& root, Opposite const& opposite, TreeUpdate const& update)
{
    std::set<OdString> paths = pathsInTheWay(root, update);
    paths.merge(stagedOtherwise(opposite, readState(root)->read()));
    if (paths.empty()) {
        return;
    }
    Failure failure(
        "These files have changes that are in no commit.",
        "Nothing has changed; commit them, or put them aside with 'tav stash', and run the command again:");
    for (OdString const& path : paths) {
        failure.details.push_back(path.ansi_str());
    }
    throw failure;
}

void stageOpposite(Opposite const& opposite, common::State& state)
{
    stage(opposite.staged, state);
    for (auto const& [path, previous] : opposite.renames) {
        state.renames[path] = previous;
    }
    for (OdString const& path : opposite.paths()) {
        state.index.erase(path);
    }
}

std::vector<FileContents>
replacedFiles(Opposite const& opposite, TreeUpdate const& update, common::RootPath const& root)
{
    std::vector<FileContents> files;
    for (Tree const* const tree : {&update.writes, &update.removals}) {
        for (auto const& [path, url] : *tree) {
            auto const present = opposite.expected.find(path);
            files.push_back(
                {path, present == opposite.expected.end() ? OdString() : present->second,
                 tree == &update.writes ? url : OdString(), ownPermissions(root.pathTo(path).ansi_str())});
        }
    }
    return files;
}

/// An operation of its own: each part of it is as before or as after, and the same command goes on from there.
void changeFiles(WriteSession& session, Opposite const& opposite, CommitRecord const& commit)
{
    common::RootPath const& root = session.root();
    TreeUpdate update;
    update.writes = opposite.writes;
    update.removals = opposite.removals;
    update.expected.insert(opposite.expected.begin(), opposite.expected.end());
    requireUntouched(root, opposite, update);
    LocalStorage storage(root);
    checkUpdate(root, session.database(), storage, {}, Discard::nothing, update);
    common::State after = readState(root)->read();
    LogEntry entry(session.database(), fromUtf8("revert " + std::to_string(commit.number)), after);
    stageOpposite(opposite, after);
    entry.operation().files = replacedFiles(opposite, update, root);
    Updated const updated = carryOut(
        root, storage, update, session.start(), [&] { entry.write(after); }, [&] { entry.keep(); });
    changeState(root, [&](common::Cache& cache) { stageOpposite(opposite, cache.write()); });
    keepVerified(updated.verified, session.database());
}

Committed commitFiles(WriteSession& session, CommitOrder const& order)
{
    try {
        return commit(session.root(), session.database(), order, session.start());
    } catch (Failure& failure) {
        failure.next += " The files are changed back and staged; 'tav undo' takes that back.";
        throw;
    }
}

void printMade(CommitRecord const& made, CommitRecord const& reverted)
{
    report(
        "Made commit " + std::to_string(made.number) + " (" + made.hash.left(12).ansi_str() +
        "), which reverts commit " + std::to_string(reverted.number) + ".\n");
}

} // namespace

void revertCommit(RevertOptions const& options)
{
    OdString const author = fromUtf8(commitAuthor());
    WriteSession session(openRepository(""), "revert", Recovery::required, Note::byCommand);
    LocalDatabase& database = session.database();
    CommitRecord const reverted = findCommit(database, options.commit);
    CommitOrder order{author, fromUtf8(messageFor(reverted, options))};
    auto const& recovered = session.recoveredCommit();
    if (recovered && recovered->message == order.message && recovered->author == author) {
        printMade(*recovered, reverted);
        return;
    }
    session.noteRecovery();
    session.failIfBetweenCommits();
    requireCommittable(session.root(), database);
    Opposite const opposite =
        oppositeOf(reverted, database.commits(), database.commits().files(database.currentCommit()));
    changeFiles(session, opposite, reverted);
    order.only = opposite.paths();
    printMade(commitFiles(session, order).commit, reverted);
}

} // namespace tav
