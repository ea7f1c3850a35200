#include "host/server/reference_rules.h"

#include "host/protocol/document.h"
#include "host/protocol/refusal.h"
#include "host/text/characters.h"

#include <algorithm>
#include <string>
#include <utility>

namespace tav {

namespace {

constexpr char const* kFetchFirst = "Merge what others have done, or send it as a branch of its own.";

void requireSameType(common::Reference const& there, common::Reference const& wanted)
{
    if (there.type != wanted.type) {
        std::string const kind = there.type == common::EType::tag ? "a tag" : "a branch";
        throw refusal(
            ServerError::referenceExists, quoted(wanted.name) + " is the name of " + kind + " already.",
            "Choose another name.");
    }
}

void requireForward(HistorySnapshot const& history, common::Reference const& there, common::Reference const& wanted)
{
    if (wanted.type == common::EType::tag) {
        throw refusal(
            ServerError::referenceExists, "The tag " + quoted(wanted.name) + " names another commit already.",
            "Choose another name.");
    }
    if (!history.isBefore(there.commitHash, wanted.commitHash)) {
        throw refusal(
            ServerError::hasMovedOn,
            "The branch " + quoted(wanted.name) + " has commits that the new one does not follow.", kFetchFirst);
    }
}

/// One that names the wanted commit already is as good: an earlier request, whose answer was lost, may have done it.
void requireExpected(std::optional<common::Reference> const& there, ReferenceChange const& change)
{
    OdString const now = there ? there->commitHash : OdString();
    if (!change.expected || now == *change.expected || now == change.reference.commitHash) {
        return;
    }
    std::string const kind = change.reference.type == common::EType::tag ? "tag " : "branch ";
    std::string const name = kind + quoted(change.reference.name);
    if (change.expected->isEmpty()) {
        throw refusal(ServerError::referenceExists, "There is a " + name + " already.", "Choose another name.");
    }
    throw refusal(
        ServerError::hasMovedOn, "The " + name + " now names a different commit.",
        "Fetch what others have done, and try again.");
}

/// Why the branch `there` may not leave these commits behind, as the ends of a sentence.
std::vector<std::string>
hindrances(HistorySnapshot const& history, common::Reference const& there, std::vector<CommitNumber> const& left)
{
    std::vector<std::string> reasons;
    for (common::Reference const& other : history.references()) {
        auto const isNamed = [&](CommitNumber const& commit) {
            return history.isBefore(commit.hash, other.commitHash);
        };
        if (other.name != there.name && std::any_of(left.begin(), left.end(), isNamed)) {
            reasons.push_back(quoted(other.name) + " has it");
        }
    }
    if (left.front().number <= history.delivered()) {
        reasons.emplace_back("it may be in other working folders");
    }
    return reasons;
}

/// A branch goes back, or aside, only while that takes no commit away from anybody.
void requireLeavable(HistorySnapshot const& history, common::Reference const& there, OdString const& to)
{
    std::vector<CommitNumber> const left = history.between(there.commitHash, to);
    std::string reasons;
    for (std::string const& reason : left.empty() ? std::vector<std::string>() : hindrances(history, there, left)) {
        reasons += (reasons.empty() ? "" : ", and ") + reason;
    }
    if (!reasons.empty()) {
        throw refusal(
            ServerError::inUse,
            "Commit " + std::to_string(left.front().number) + " cannot be taken back: " + reasons + ".",
            "Make another commit that puts things right.");
    }
}

void removeReference(HistoryTransaction& history, ReferenceChange const& change, Force force)
{
    auto const there = history.reference(change.reference.name);
    if (!there) {
        return;
    }
    requireSameType(*there, change.reference);
    requireExpected(there, change);
    if (force == Force::no) {
        requireLeavable(history, *there, OdString());
    }
    history.removeReference(there->name);
}

/// Whether all references that there are move with the commit, and are known to whoever moves them.
bool movesAll(NewCommit const& added, HistorySnapshot const& history)
{
    auto const isMoved = [&](common::Reference const& there) {
        auto const isIt = [&](ReferenceChange const& change) {
            return change.reference.name == there.name && change.expected == there.commitHash;
        };
        return std::any_of(added.references.begin(), added.references.end(), isIt);
    };
    auto const references = history.references();
    return std::all_of(references.begin(), references.end(), isMoved);
}

} // namespace

void setReference(HistoryTransaction& history, ReferenceChange const& change, Force force)
{
    common::Reference const& wanted = change.reference;
    if (wanted.commitHash.isEmpty()) {
        removeReference(history, change, force);
        return;
    }
    if (!history.find(wanted.commitHash)) {
        throw refusal(
            ServerError::noReference,
            "The server does not have the commit " + quoted(wanted.commitHash) + " of " + quoted(wanted.name) + ".",
            kNothingChanged);
    }
    auto const there = history.reference(wanted.name);
    if (there) {
        requireSameType(*there, wanted);
    }
    requireExpected(there, change);
    if (there && force == Force::no && there->commitHash != wanted.commitHash) {
        if (change.expected && wanted.type == common::EType::branch) {
            requireLeavable(history, *there, wanted.commitHash);
        } else {
            requireForward(history, *there, wanted);
        }
    }
    history.set(wanted);
}

bool hasPassed(HistorySnapshot const& history, common::Reference const& branch, OdString const& hash)
{
    auto const there = history.reference(branch.name);
    return there && there->type == branch.type && branch.type == common::EType::branch && branch.commitHash == hash &&
           history.isBefore(hash, there->commitHash);
}

void requireParents(HistorySnapshot const& history, NewCommit const& added)
{
    for (OdString const& parent : added.commit.parents) {
        if (!history.find(parent)) {
            throw refusal(
                ServerError::noReference, "The server does not have the parent commit " + quoted(parent) + ".",
                kNothingChanged);
        }
    }
    if (added.commit.parents.empty() && !movesAll(added, history)) {
        throw refusal(
            ServerError::hasMovedOn, "The repository has commits already; one without a parent would not follow them.",
            kFetchFirst);
    }
}

} // namespace tav
