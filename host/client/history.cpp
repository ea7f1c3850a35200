#include "host/client/history.h"

#include "host/errors/failure.h"
#include "host/protocol/commit_document.h"
#include "host/protocol/history_document.h"
#include "host/storage/local_storage.h"
#include "host/text/json_text.h"

#include "json/json_reader.h"

#include <algorithm>
#include <cerrno>
#include <iterator>
#include <set>
#include <tuple>
#include <utility>

namespace tav {

namespace {

constexpr char const* kAskOwner = "The server is damaged, or is not a tav server; ask its owner.";

constexpr char const* kSendThem =
    "An older copy of it may have been put back: run 'tav server --send' to send them again.";

/// What `read` makes of an answer of the server, which is checked as strictly as what clients send.
template <class Read>
auto readAnswer(OdString const& answer, Read read)
{
    try {
        return read(answer);
    } catch (Failure const& failure) {
        throw Failure("The answer of the server cannot be used: " + failure.what, kAskOwner);
    }
}

OdString numbersDocument(std::int64_t number)
{
    kutils::json::Object pair;
    pair[L"commitNo"] = number;
    pair[L"hash"] = L"";
    return compactText(kutils::json::Array{std::move(pair)});
}

/// The commits of the server from the number `first` on, in ascending order.
std::vector<CommitNumber> numbersThere(Connection& connection, std::int64_t first)
{
    return readAnswer(connection.request("numbers", numbersDocument(first)), readNumbers);
}

bool isBefore(CommitNumber const& a, CommitNumber const& b)
{
    return std::tie(a.number, a.hash) < std::tie(b.number, b.hash);
}

/// The commits of `some` that `others` has not, or has under another number.
std::vector<CommitNumber> without(std::vector<CommitNumber> const& some, std::vector<CommitNumber> const& others)
{
    std::vector<CommitNumber> rest;
    std::set_difference(some.begin(), some.end(), others.begin(), others.end(), std::back_inserter(rest), isBefore);
    return rest;
}

/// A content of a commit that was made elsewhere, or entered in a database that has been lost since, may be kept here.
void enterContents(LocalDatabase& database, LocalStorage& storage, std::vector<FileRecord> const& changes)
{
    for (FileRecord const& change : changes) {
        if (change.url.isEmpty() || database.sizeOf(change.url)) {
            continue;
        }
        auto const size = storage.size(change.url);
        if (size.hasValue()) {
            database.addContent(change.url, *digestOf(change.url), size.value());
        } else if (size.error().code != 0 && size.error().code != ENOENT) { // It may be here all the same.
            throw Failure(size.error(), "Check the disk and your rights, and run the command again.");
        }
    }
}

/// Returns how many of the commits were unknown. Part of a `WriteTransaction` of the caller.
std::size_t enterPage(common::RootPath const& root, LocalDatabase& database, std::vector<ChangedCommit> const& page)
{
    LocalStorage storage(root);
    std::size_t added = 0;
    for (ChangedCommit const& next : page) {
        if (!database.commits().find(next.commit.hash)) {
            database.commits().addChanges(next.commit, next.changes);
            ++added;
        }
        enterContents(database, storage, next.changes);
    }
    return added;
}

std::size_t
enterCommits(common::RootPath const& root, LocalDatabase& database, Connection& connection, std::int64_t known)
{
    std::size_t added = 0;
    forEachPageThere(connection, known, [&](std::vector<ChangedCommit> const& page) {
        WriteTransaction transaction(database.database());
        added += enterPage(root, database, page);
        transaction.commit();
    });
    return added;
}

std::size_t enterReferences(LocalDatabase& database, std::vector<common::Reference> references)
{
    auto const isKnown = [&](common::Reference const& reference) {
        auto const here = database.commits().reference(reference.name);
        return here && here->type == reference.type && here->commitHash == reference.commitHash;
    };
    references.erase(std::remove_if(references.begin(), references.end(), isKnown), references.end());
    if (references.empty()) {
        return 0;
    }
    WriteTransaction transaction(database.database());
    for (common::Reference const& reference : references) {
        database.commits().set(reference);
    }
    transaction.commit();
    return references.size();
}

} // namespace

HistoryComparison compareHistory(LocalDatabase const& database, Connection& connection)
{
    std::vector<CommitNumber> const here = database.commits().numbersFrom(1);
    std::vector<CommitNumber> const there = numbersThere(connection, 1);
    return {without(there, here).size(), without(here, there).size()};
}

void forEachPageThere(
    Connection& connection, std::int64_t known, std::function<void(std::vector<ChangedCommit> const&)> const& take)
{
    for (;;) {
        std::vector<ChangedCommit> const page =
            readAnswer(connection.request("history", numbersDocument(known)), readHistoryPage);
        for (ChangedCommit const& next : page) {
            if (next.commit.number != ++known) {
                throw Failure("The server does not send its commit " + std::to_string(known) + ".", kAskOwner);
            }
        }
        if (page.empty()) {
            return;
        }
        take(page);
    }
}

std::vector<common::Reference> referencesThere(Connection& connection)
{
    return readAnswer(connection.request("references", L"[]"), [](OdString const& text) {
        std::vector<common::Reference> references;
        for (ReferenceChange const& there : readReferences(text)) {
            references.push_back(there.reference);
        }
        return references;
    });
}

bool isNamedThere(OdString const& name, LocalDatabase const& database)
{
    try {
        Connection connection(database);
        std::vector<common::Reference> const names = referencesThere(connection);
        auto const isIt = [&](common::Reference const& reference) { return reference.name == name; };
        return std::any_of(names.begin(), names.end(), isIt);
    } catch (Failure const&) {
        return false;
    }
}

bool isOnServer(OdString const& hash, Connection& connection)
{
    std::vector<CommitNumber> const there = numbersThere(connection, 1);
    return std::any_of(there.begin(), there.end(), [&](CommitNumber const& commit) { return commit.hash == hash; });
}

std::vector<OdString> missingThere(LocalDatabase const& database, Connection& connection)
{
    std::set<OdString> there;
    for (CommitNumber const& commit : numbersThere(connection, 1)) {
        there.insert(commit.hash);
    }
    std::vector<OdString> missing;
    for (CommitNumber const& commit : database.commits().numbersFrom(1)) {
        if (there.count(commit.hash) == 0) {
            missing.push_back(commit.hash);
        }
    }
    return missing;
}

// References are asked for first: should another program add a commit meanwhile, what they name is still among the
// commits.
Fetched fetchHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection, Compared compared)
{
    std::vector<common::Reference> references = referencesThere(connection);
    std::int64_t const known = database.commits().lastWithoutGap();
    std::int64_t const first = compared == Compared::everything ? 1 : known;
    std::vector<CommitNumber> const there = numbersThere(connection, first);
    if (!without(database.commits().numbersFrom(first), there).empty()) {
        Failure failure(
            "The server in '" + connection.serverFolder().ansi_str() + "' lacks commits that are known here.",
            kSendThem);
        failure.code = static_cast<std::int32_t>(ServerError::isBehind);
        throw failure;
    }
    Fetched fetched;
    if (!there.empty() && there.back().number > known) {
        fetched.commits = enterCommits(root, database, connection, known);
    }
    fetched.references = enterReferences(database, std::move(references));
    return fetched;
}

void replaceHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection)
{
    std::vector<common::Reference> const references = referencesThere(connection);
    WriteTransaction transaction(database.database());
    database.commits().clear();
    forEachPageThere(connection, 0, [&](std::vector<ChangedCommit> const& page) { enterPage(root, database, page); });
    for (common::Reference const& reference : references) {
        database.commits().set(reference);
    }
    transaction.commit();
}

} // namespace tav
