#include "host/client/resend.h"

#include "host/protocol/commit_document.h"
#include "host/terminal/progress.h"

#include <algorithm>
#include <map>
#include <optional>

namespace tav {

namespace {

/// A commit as it was when it was new.
NewCommit wholeCommit(CommitTables const& tables, OdString const& hash)
{
    NewCommit whole;
    whole.commit = *tables.find(hash);
    std::map<OdString, OdString> previous;
    for (FileRecord const& change : tables.changes(hash)) {
        previous.emplace(change.path, change.previousPath);
    }
    for (auto const& [path, url] : tables.files(hash)) {
        auto const change = previous.find(path);
        whole.files.push_back({path, url, change == previous.end() ? OdString() : change->second});
    }
    return whole;
}

/// What moves `here` to the server, where `there` is what the server has; none where the server's is as good or better.
std::optional<ReferenceChange>
changeTo(common::Reference const& here, std::vector<common::Reference> const& there, CommitTables const& tables)
{
    auto const isIt = [&](common::Reference const& other) { return other.name == here.name; };
    auto const found = std::find_if(there.begin(), there.end(), isIt);
    if (found == there.end()) {
        return ReferenceChange{here, OdString()};
    }
    bool const isBehind = here.type == common::EType::branch && found->type == here.type &&
                          found->commitHash != here.commitHash && tables.isBefore(found->commitHash, here.commitHash);
    return isBehind ? std::optional(ReferenceChange{here, found->commitHash}) : std::nullopt;
}

void sendReferences(CommitTables const& tables, Connection& connection)
{
    std::vector<common::Reference> const there = referencesThere(connection);
    std::vector<ReferenceChange> changes;
    for (common::Reference const& here : tables.references()) {
        if (auto change = changeTo(here, there, tables)) {
            changes.push_back(std::move(*change));
        }
    }
    if (!changes.empty()) {
        connection.request("references", referenceChanges(changes));
    }
}

/// Those of the references `before` that no longer lead to their commits.
std::vector<common::Reference> givenUp(std::vector<common::Reference> const& before, CommitTables const& tables)
{
    std::vector<common::Reference> gone;
    for (common::Reference const& reference : before) {
        auto const now = tables.reference(reference.name);
        bool const isSame = now && now->type == reference.type && now->commitHash == reference.commitHash;
        bool const isFollowed = now && now->type == common::EType::branch && reference.type == now->type &&
                                tables.isBefore(reference.commitHash, now->commitHash);
        if (!isSame && !isFollowed) {
            gone.push_back(reference);
        }
    }
    return gone;
}

} // namespace

Sent sendAgain(common::RootPath const& root, LocalDatabase& database, Connection& connection)
{
    CommitTables const& tables = database.commits();
    std::vector<common::Reference> const before = tables.references();
    std::vector<OdString> const missing = missingThere(database, connection);
    Progress progress("commits", missing.size());
    for (OdString const& hash : missing) {
        connection.request("commit", commitInfoDocument(wholeCommit(tables, hash)));
        progress.advance();
    }
    sendReferences(tables, connection);
    if (compareHistory(database, connection).unknownThere > 0) { // Under the same numbers, that is.
        replaceHistory(root, database, connection);
    } else {
        fetchHistory(root, database, connection, Compared::everything);
    }
    return {missing.size(), givenUp(before, tables)};
}

} // namespace tav
