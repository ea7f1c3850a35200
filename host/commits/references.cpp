#include "host/commits/references.h"

#include "host/client/history.h"
#include "host/errors/failure.h"
#include "host/history/reference_name.h"
#include "host/protocol/commit_document.h"
#include "host/text/characters.h"

#include <algorithm>
#include <string>
#include <vector>

namespace tav {

namespace {

std::string kindOf(common::Reference const& reference)
{
    return reference.type == common::EType::branch ? "branch" : "tag";
}

void requireFreeName(LocalDatabase const& database, OdString const& name)
{
    if (auto const old = database.commits().reference(name)) {
        throw Failure("There is a " + kindOf(*old) + " '" + name.ansi_str() + "' already.", "Choose another name.");
    }
    requireReferenceName(name);
}

/// Whether another branch or tag leads to the commit of this one, and so to all before it.
bool isReachedFromOthers(CommitTables const& commits, common::Reference const& reference)
{
    std::vector<common::Reference> const all = commits.references();
    return std::any_of(all.begin(), all.end(), [&](common::Reference const& other) {
        return other.name != reference.name &&
               (other.commitHash == reference.commitHash || commits.isBefore(reference.commitHash, other.commitHash));
    });
}

/// It is made, not moved: one of that name may be there that is not known here.
void makeOnServer(common::Reference const& reference, LocalDatabase const& database)
{
    try {
        Connection(database).request("references", referenceChanges({{reference, OdString::kEmpty}}));
    } catch (Failure& failure) {
        if (isNamedThere(reference.name, database)) {
            failure.next = "Run 'tav fetch' to see what the server has under this name.";
        }
        throw;
    }
}

} // namespace

void requireReferenceName(OdString const& name)
{
    if (auto const fault = whyNotReferenceName(name)) {
        throw Failure("The name " + quoted(name) + " " + *fault + ".", "Choose another name.");
    }
}

void makeReference(LocalDatabase& database, common::Reference const& reference)
{
    requireFreeName(database, reference.name);
    makeOnServer(reference, database);
    try {
        WriteTransaction transaction(database.database());
        database.commits().set(reference);
        transaction.commit();
    } catch (Failure& failure) {
        failure.next = "The server has the " + kindOf(reference) + "; correct that and run 'tav fetch'.";
        throw;
    }
}

common::Reference findReference(LocalDatabase const& database, OdString const& name, common::EType type)
{
    auto const reference = database.commits().reference(name);
    common::Reference const wanted(name, OdString(), type);
    if (!reference || reference->type != type) {
        std::string const kind = kindOf(wanted);
        throw Failure(
            "There is no " + kind + " '" + name.ansi_str() + "'.",
            "Run 'tav " + kind + "' to see those that there are.");
    }
    return *reference;
}

void failIfOnlyWayToCommits(LocalDatabase const& database, common::Reference const& reference)
{
    if (!isReachedFromOthers(database.commits(), reference)) {
        throw Failure(
            "Only the " + kindOf(reference) + " '" + reference.name.ansi_str() + "' leads to its last commits.",
            "Create a tag there to keep them in the history, or delete it with --force.");
    }
}

void removeReference(LocalDatabase& database, common::Reference const& reference)
{
    common::Reference const none(reference.name, OdString(), reference.type);
    Connection(database).request("force-references", referenceChanges({{none, reference.commitHash}}));
    WriteTransaction transaction(database.database());
    database.commits().removeReference(reference.name);
    transaction.commit();
}

void renameBranch(
    LocalDatabase& database, common::Reference const& branch, OdString const& name,
    std::function<void()> const& whenSent)
{
    requireFreeName(database, name);
    common::Reference const none(branch.name, OdString(), branch.type);
    common::Reference const renamed(name, branch.commitHash, branch.type);
    Connection(database).request(
        "force-references", referenceChanges({{none, branch.commitHash}, {renamed, OdString::kEmpty}}));
    whenSent();
    WriteTransaction transaction(database.database());
    database.commits().removeReference(branch.name);
    database.commits().set(renamed);
    transaction.commit();
}

} // namespace tav
