#include "host/repository/history.h"

#include "host/failure.h"
#include "host/server/commit_document.h"
#include "host/server/history_document.h"
#include "host/storage/local_storage.h"
#include "host/text/json_text.h"

#include "json/json_reader.h"

#include <algorithm>
#include <iterator>
#include <tuple>
#include <utility>

namespace tav {

namespace {

constexpr char const* kAskOwner = "The server is damaged, or is not a server of tav; ask its owner.";

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
void enterContents(
    common::RootPath const& root, LocalDatabase& database, LocalStorage& storage,
    std::vector<FileRecord> const& changes)
{
    for (FileRecord const& change : changes) {
        if (change.url.isEmpty() || database.sizeOf(change.url)) {
            continue;
        }
        if (auto const size = storage.size(root, change.url); size.hasValue()) {
            database.addContent(change.url, *digestOf(change.url), size.value());
        }
    }
}

/// Enters the commits of a page behind the number `last`, in one change. Returns how many were unknown.
std::size_t enterPage(
    common::RootPath const& root, LocalDatabase& database, std::vector<ChangedCommit> const& page, std::int64_t last)
{
    Change change(database.database());
    LocalStorage storage;
    std::size_t added = 0;
    for (ChangedCommit const& next : page) {
        if (next.commit.number != ++last) {
            throw Failure("The server does not send its commit " + std::to_string(last) + ".", kAskOwner);
        }
        if (!database.commits().find(next.commit.hash)) {
            database.commits().addChanges(next.commit, next.changes);
            ++added;
        }
        enterContents(root, database, storage, next.changes);
    }
    change.commit();
    return added;
}

std::size_t enterCommits(
    common::RootPath const& root, LocalDatabase& database, Connection& connection, std::int64_t known, std::int64_t end)
{
    std::size_t added = 0;
    while (known < end) {
        std::vector<ChangedCommit> const page =
            readAnswer(connection.request("history", numbersDocument(known)), readHistoryPage);
        if (page.empty()) {
            throw Failure("The server does not send its commit " + std::to_string(known + 1) + ".", kAskOwner);
        }
        added += enterPage(root, database, page, known);
        known = page.back().commit.number;
    }
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
    Change change(database.database());
    for (common::Reference const& reference : references) {
        database.commits().set(reference);
    }
    change.commit();
    return references.size();
}

} // namespace

HistoryComparison compareHistory(LocalDatabase const& database, Connection& connection)
{
    std::vector<CommitNumber> const here = database.commits().numbersFrom(1);
    std::vector<CommitNumber> const there = numbersThere(connection, 1);
    return {without(there, here).size(), without(here, there).size()};
}

bool isOnServer(OdString const& hash, Connection& connection)
{
    std::vector<CommitNumber> const there = numbersThere(connection, 1);
    return std::any_of(there.begin(), there.end(), [&](CommitNumber const& commit) { return commit.hash == hash; });
}

Learned learnHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection, Compared compared)
{
    // References first: should another program add a commit meanwhile, what they name is among the commits all the
    // same.
    std::vector<common::Reference> references =
        readAnswer(connection.request("references", L"[]"), [](OdString const& text) { return readReferences(text); });
    std::int64_t const known = database.commits().lastWithoutGap();
    std::int64_t const first = compared == Compared::everything ? 1 : known;
    std::vector<CommitNumber> const there = numbersThere(connection, first);
    if (!without(database.commits().numbersFrom(first), there).empty()) {
        throw Failure(
            "The server in '" + database.serverFolder().ansi_str() + "' lacks commits that are known here.",
            "Put a newer copy of it in its place.");
    }
    std::int64_t const end = there.empty() ? 0 : there.back().number;
    Learned learned;
    learned.commits = enterCommits(root, database, connection, known, end);
    learned.references = enterReferences(database, std::move(references));
    return learned;
}

} // namespace tav
