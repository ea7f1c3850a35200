#include "host/checkout/checkout.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/planned_update.h"
#include "host/cli/typed_command.h"
#include "host/client/history.h"
#include "host/commits/commit_names.h"
#include "host/commits/references.h"
#include "host/errors/failure.h"
#include "host/repository/journal.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <filesystem>
#include <optional>
#include <string>

namespace tav {

namespace {

Discard discardOf(CheckoutOptions const& options)
{
    return options.force ? Discard::everything : Discard::nothing;
}

/// "(2 files written, 1 removed)"; nothing where no file had to change.
std::string countsOf(CheckedOut const& result)
{
    std::string text;
    if (result.written > 0) {
        text = counted(result.written, "file") + " written";
    }
    if (result.removed > 0) {
        text += text.empty() ? counted(result.removed, "file") : ", " + std::to_string(result.removed);
        text += " removed";
    }
    return text.empty() ? text : " (" + text + ")";
}

/// `root` is where the move has ended.
std::string described(CheckedOut const& result, common::RootPath const& root)
{
    std::string text = countsOf(result) + ".\n";
    if (result.kept > 0) {
        text +=
            counted(result.kept, "changed file") + (result.kept == 1 ? " stays as it is.\n" : " stay as they are.\n");
    }
    std::size_t const staged = readState(root)->read().stagedFiles.size();
    return staged == 0 ? text : text + counted(staged, "staged file") + " carried along.\n";
}

void goTo(
    WriteSession& session, common::Reference const& branch, OdString const& command, CheckoutOptions const& options)
{
    CheckedOut const result = checkOutCommit(
        session.root(), session.database(), {branch.commitHash, branch.name}, command, discardOf(options),
        session.start());
    report("Now on branch " + shown(branch.name) + described(result, session.root()));
}

/// Before the first commit no branch exists, and the first one only gets another name.
void nameFirstBranch(common::RootPath const& root, OdString const& name)
{
    requireReferenceName(name);
    changeState(root, [&](common::Cache& cache) { cache.write().head = name; });
    report("Now on branch " + shown(name) + ".\n");
}

void switchToNew(WriteSession& session, CheckoutOptions const& options)
{
    LocalDatabase& database = session.database();
    OdString const name = fromUtf8(options.target);
    if (options.commit.empty() && database.currentCommit().isEmpty()) {
        nameFirstBranch(session.root(), name);
        return;
    }
    session.failIfBetweenCommits();
    common::Reference const branch(name, findCommit(database, options.commit).hash, common::EType::branch);
    makeReference(database, branch);
    try {
        goTo(session, branch, typedCommand("switch -c", {options.target}), options);
    } catch (Failure const&) {
        if (readState(session.root())->read().head != name && readJournal(database).index() == 0) {
            removeReference(database, branch); // Nothing has been touched, so the command has done nothing.
        }
        throw;
    }
}

bool isFile(std::string const& name)
{
    std::error_code error;
    return std::filesystem::exists(std::filesystem::symlink_status(name, error));
}

CommitRecord commitToGoTo(LocalDatabase const& database, std::string const& typed)
{
    auto const commit = findCommitIfAny(database, typed);
    if (!commit && isFile(typed)) {
        throw Failure(
            "'" + typed + "' is a file, not a commit.", "Run 'tav restore " + typed + "' to bring a file back.");
    }
    return commit ? *commit : findCommit(database, typed);
}

[[noreturn]] void failForUnknownBranch(std::string const& name, LocalDatabase const& database)
{
    if (isNamedThere(fromUtf8(name), database)) {
        throw Failure(
            "'" + name + "' is known only to the server.", "Run 'tav fetch' to get it, and then this command again.");
    }
    throw Failure(
        "There is no branch '" + name + "'.",
        "Run 'tav branch' to see those that there are, or 'tav switch -c NAME' to create one.");
}

common::Reference branchToGoTo(LocalDatabase const& database, std::string const& typed)
{
    auto const branch = database.commits().reference(fromUtf8(typed));
    if (branch && branch->type == common::EType::tag) {
        throw Failure("'" + typed + "' is a tag.", "Use 'tav checkout " + typed + "' to go there.");
    }
    if (!branch) {
        failForUnknownBranch(typed, database);
    }
    return *branch;
}

std::optional<common::Reference> branchIfAny(LocalDatabase const& database, std::string const& typed)
{
    auto reference = database.commits().reference(fromUtf8(typed));
    return reference && reference->type == common::EType::branch ? reference : std::nullopt;
}

void preview(
    std::string const& what, OdString const& commit, CheckoutOptions const& options, common::RootPath const& root,
    LocalDatabase const& database)
{
    notePending(root, database);
    PlannedCheckout const planned = planCheckout(root, database, commit, discardOf(options));
    print("Would go to " + what + ".\n");
    printPlan(planned.update, planned.discarded);
}

void previewCheckout(CheckoutOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (auto const branch = branchIfAny(database, options.target)) {
        preview("branch " + shown(branch->name), branch->commitHash, options, root, database);
        return;
    }
    CommitRecord const commit = commitToGoTo(database, options.target);
    preview("commit " + std::to_string(commit.number), commit.hash, options, root, database);
}

/// Only the server knows all names that are taken.
void previewNewBranch(CheckoutOptions const& options, common::RootPath const& root, LocalDatabase const& database)
{
    OdString const name = fromUtf8(options.target);
    requireReferenceName(name);
    if (auto const taken = database.commits().reference(name)) {
        std::string const kind = taken->type == common::EType::tag ? "tag" : "branch";
        throw Failure("There is a " + kind + " '" + options.target + "' already.", "Choose another name.");
    }
    bool const isFirst = options.commit.empty() && database.currentCommit().isEmpty();
    OdString const commit = isFirst ? OdString() : findCommit(database, options.commit).hash;
    preview("the new branch " + shown(name), commit, options, root, database);
}

void previewSwitch(CheckoutOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (options.isNew) {
        previewNewBranch(options, root, database);
        return;
    }
    common::Reference const branch = branchToGoTo(database, options.target);
    preview("branch " + shown(branch.name), branch.commitHash, options, root, database);
}

} // namespace

void checkOut(CheckoutOptions const& options)
{
    if (options.dryRun) {
        previewCheckout(options);
        return;
    }
    WriteSession session(openRepository(""), "checkout");
    if (auto const branch = branchIfAny(session.database(), options.target)) {
        goTo(session, *branch, typedCommand("checkout", {options.target}), options);
        return;
    }
    CommitRecord const commit = commitToGoTo(session.database(), options.target);
    OdString const branch = readState(session.root())->read().head;
    CheckedOut const result = checkOutCommit(
        session.root(), session.database(), {commit.hash, branch}, typedCommand("checkout", {options.target}),
        discardOf(options), session.start());
    auto const end = session.database().commits().reference(branch);
    bool const isAtTheEnd = !end || end->commitHash == commit.hash;
    report(
        "Now at commit " + std::to_string(commit.number) + described(result, session.root()) +
        (isAtTheEnd ? "" : "To commit here, create a branch with 'tav switch -c NAME'.\n"));
}

void switchBranch(CheckoutOptions const& options)
{
    if (options.dryRun) {
        previewSwitch(options);
        return;
    }
    WriteSession session(openRepository(""), "switch");
    if (options.isNew) {
        switchToNew(session, options);
        return;
    }
    goTo(session, branchToGoTo(session.database(), options.target), typedCommand("switch", {options.target}), options);
}

} // namespace tav
