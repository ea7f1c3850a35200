#include "host/commits/commit.h"

#include "host/changes/changes.h"
#include "host/changes/index_record.h"
#include "host/changes/staging.h"
#include "host/client/connection.h"
#include "host/client/history.h"
#include "host/commits/joined_renames.h"
#include "host/commits/similar_files.h"
#include "host/errors/failure.h"
#include "host/history/commit_hash.h"
#include "host/history/tracked_path.h"
#include "host/history/tree.h"
#include "host/protocol/commit_document.h"
#include "host/protocol/members.h"
#include "host/repository/conflicts.h"
#include "host/repository/working_state.h"
#include "host/storage/local_storage.h"
#include "host/terminal/progress.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include "common/mu_common_serialization.h"
#include "common/mu_common_versions.h"
#include "json/json_reader.h"

#include "platform/ut/FileName.h"

#include <algorithm>
#include <ctime>
#include <filesystem>
#include <set>
#include <utility>

namespace tav {

namespace {

constexpr int kMostAttempts = 5; // at a file that somebody is writing
constexpr char const* kAskOwner = "The server is damaged or is not a tav server; ask its owner.";

using Previous = std::map<OdString, OdString>;

/// A commit that takes shape.
struct Draft {
    common::RootPath const& root;
    LocalDatabase& database;
    std::uint64_t start;
    Tree files;        ///< of the new commit, in the end
    Previous previous; ///< paths of files that have been renamed since the current commit
    PendingCommit pending;
    VerifiedFileList verified = {}; ///< all files that were read
};

/// The way to the file is gone anew each time: a folder may be replaced meanwhile.
FileStamp stampOf(OdString const& path, common::RootPath const& root)
{
    return FolderView(root).look(path).stamp.value_or(FileStamp{});
}

/// Stores a content that does not change meanwhile, and keeps the stamp that the file had then.
OdString storeSteady(Draft& draft, LocalStorage& storage, OdString const& path)
{
    for (int attempt = 0; attempt < kMostAttempts; ++attempt) {
        FileStamp const before = stampOf(path, draft.root);
        auto const url = storage.store(path);
        if (stampOf(path, draft.root) != before) {
            continue;
        }
        draft.pending.files[path] = indexRecord(static_cast<std::uint64_t>(before.modified), draft.start);
        OdString const stored = valueOrFail(url, "Nothing has been committed; correct that and run the command again.");
        draft.verified.push_back({path.ansi_str(), *digestOf(stored), before});
        return stored;
    }
    throw Failure(
        quoted(path) + " keeps being changed by another program.",
        "Save and close it there, and run the command again.");
}

/// The version of the file that the new one follows.
OdString previousUrl(Draft const& draft, Tree const& base, OdString const& path)
{
    auto const rename = draft.previous.find(path);
    auto const version = base.find(rename == draft.previous.end() ? path : rename->second);
    return version == base.end() ? OdString() : version->second;
}

void storeAll(Draft& draft, std::vector<PlannedFile> const& plan, LocalStorage& storage)
{
    Progress progress("files", plan.size());
    for (PlannedFile const& file : plan) {
        if (file.change == common::FileChange::removed) {
            draft.files.erase(file.path);
            draft.pending.files[file.path] = std::nullopt;
        } else {
            draft.files[file.path] = storeSteady(draft, storage, file.path);
        }
        progress.advance();
    }
    valueOrFail(storage.flush(), "Nothing has been committed; check the free space.");
}

/// Reads back what the commit relies on.
void readBack(Draft& draft, std::vector<PlannedFile> const& plan, LocalStorage& storage)
{
    Progress progress("files read back", plan.size());
    std::set<OdString> done;
    for (PlannedFile const& file : plan) {
        progress.advance();
        auto const version = draft.files.find(file.path);
        if (version == draft.files.end() || !done.insert(version->second).second) {
            continue;
        }
        OdString const& url = version->second;
        valueOrFail(storage.verify(url), "Nothing has been committed; the disk may be failing.");
        std::uint64_t const size = valueOrFail(storage.size(url), "Nothing has been committed.");
        draft.pending.contents.push_back({url, *digestOf(url), size});
    }
}

std::vector<OdString> parentsOf(CommitOrder const& order, LocalDatabase const& database)
{
    if (order.replaced) {
        return order.replaced->parents;
    }
    OdString const parent = database.currentCommit();
    return parent.isEmpty() ? std::vector<OdString>() : std::vector{parent};
}

NewCommit newCommit(Draft const& draft, CommitOrder const& order, OdString const& branch)
{
    NewCommit added;
    added.commit.author = order.author;
    added.commit.message = order.message;
    added.commit.date = std::time(nullptr);
    added.commit.parents = parentsOf(order, draft.database);
    Previous const previous =
        order.replaced ? joinedRenames(draft.previous, draft.files, draft.database.commits(), *order.replaced)
                       : draft.previous;
    for (auto const& [path, url] : draft.files) {
        auto const rename = previous.find(path);
        added.files.push_back({path, url, rename == previous.end() ? OdString::kEmpty : rename->second});
    }
    added.commit.hash = commitHash(added.commit, added.files);
    auto const end = draft.database.commits().reference(branch);
    added.references.push_back(
        {{branch, added.commit.hash, common::EType::branch}, end ? end->commitHash : OdString::kEmpty});
    return added;
}

void failIfNotAtTheEnd(LocalDatabase const& database, OdString const& branch)
{
    auto const reference = database.commits().reference(branch);
    if (!reference || reference->commitHash == database.currentCommit()) {
        return;
    }
    throw Failure(
        "You are at an earlier commit, not at the end of the branch '" + branch.ansi_str() + "'.",
        "Run 'tav branch NAME' and 'tav switch NAME' to go on from here, or 'tav switch " + branch.ansi_str() +
            "' to go back to its end.");
}

/// Sends the commit and returns its number. One that the server refuses is given up; after any other failure the server
/// may have it from a try before, so the journal keeps it until that is known.
std::int64_t
sentNumber(NewCommit const& commit, OdString const& document, LocalDatabase& database, Connection& connection)
{
    kutils::json::Value answer;
    try {
        kutils::json::read_string(answer, connection.request("commit", document));
    } catch (Failure& failure) {
        bool const isElsewhere = failure.code == static_cast<std::int32_t>(ServerError::noRepository);
        if (isElsewhere || !isOnServer(commit.commit.hash, connection)) {
            giveUpOperation(database);
        }
        if (isElsewhere) {
            failure.next += " The files are still staged.";
        } else if (failure.code == static_cast<std::int32_t>(ServerError::hasMovedOn)) {
            failure.next += " With 'tav branch NAME' and 'tav switch NAME' you have a branch of your own.";
        }
        throw;
    }
    auto const numbers = valueOrFail(common::deserializeCommitNumbers(answer.get_array()), kAskOwner);
    if (numbers.size() != 1) {
        throw Failure("The server did not number the commit.", kAskOwner);
    }
    return numbers.front().commitNo;
}

/// Others may have gone on from the commit before its end was entered here.
void setUnlessPassed(common::Reference const& reference, LocalDatabase& database)
{
    auto const there = database.commits().reference(reference.name);
    if (!there || !database.commits().isBefore(reference.commitHash, there->commitHash)) {
        database.commits().set(reference);
    }
}

void failUnlessNext(std::int64_t number, LocalDatabase const& database)
{
    if (number != database.commits().lastWithoutGap() + 1) {
        throw Failure("The server gave the commit a number that does not follow its last one.", kAskOwner);
    }
}

void enter(NewCommit const& commit, PendingCommit const& pending, LocalDatabase& database)
{
    WriteTransaction transaction(database.database());
    if (!database.commits().find(commit.commit.hash)) {
        failUnlessNext(commit.commit.number, database);
        database.commits().add(commit.commit, commit.files);
    }
    for (ReferenceChange const& moved : commit.references) {
        setUnlessPassed(moved.reference, database);
    }
    for (NewContent const& content : pending.contents) {
        database.addContent(content.url, content.digest, content.size);
    }
    database.setCurrentCommit(commit.commit.hash);
    transaction.commit();
}

FolderChanges compareWithBase(Draft& draft)
{
    FileList committed;
    committed.reserve(draft.files.size());
    for (auto const& [path, url] : draft.files) {
        committed.push_back({path, url.ansi_str()});
    }
    FolderChanges changes = compare(
        draft.root, matchFolder(draft.root, std::move(committed), draft.database.verifiedFiles()), &draft.verified);
    for (VerifiedFile const& file : draft.verified) {
        draft.pending.files.emplace(
            fromUtf8(file.path), indexRecord(static_cast<std::uint64_t>(file.stamp.modified), draft.start));
    }
    return changes;
}

std::optional<CommitRecord> lastCommitIfOf(CommitOrder const& order, LocalDatabase const& database)
{
    auto last = database.commits().find(database.currentCommit());
    bool const isSame = last && last->author == order.author && last->message == order.message;
    return isSame ? last : std::nullopt;
}

/// The user has seen the commit before the lock was taken.
void requireReplacedIsCurrent(CommitOrder const& order, LocalDatabase const& database)
{
    if (order.replaced && order.replaced->hash != database.currentCommit()) {
        throw Failure(
            "Commit " + std::to_string(order.replaced->number) + " is not the current one any more.",
            "Nothing has been committed; look at 'tav log', and run the command again.");
    }
}

void failIfNothingIsLeft(Draft const& draft, CommitRecord const& replaced)
{
    Tree const before = replaced.parents.empty() ? Tree() : draft.database.commits().files(replaced.parents.front());
    if (replaced.parents.size() < 2 && draft.files == before) {
        throw Failure(
            "Commit " + std::to_string(replaced.number) + " would change nothing any more.",
            "Nothing has been committed; leave out --amend for a new commit that takes it back.");
    }
}

/// A file whose former path is left alone has not been renamed by the commit.
void leaveOthers(std::set<OdString> const& only, std::vector<PlannedFile>& plan)
{
    auto const isOther = [&](PlannedFile const& file) { return only.count(file.path) == 0; };
    plan.erase(std::remove_if(plan.begin(), plan.end(), isOther), plan.end());
    for (PlannedFile& file : plan) {
        if (only.count(file.previousPath) == 0) {
            file.previousPath = OdString::kEmpty;
        }
    }
}

/// The state file may come from anywhere.
void checkNames(std::vector<PlannedFile> const& plan)
{
    Failure failure(
        "No commit can keep these names.",
        "Nothing has been committed; rename the files, or take them out with 'tav unstage NAME':");
    for (PlannedFile const& file : plan) {
        auto fault = file.change == common::FileChange::removed ? std::nullopt : whyNotKept(file.path);
        if (fault) {
            failure.details.push_back(std::move(*fault));
        }
    }
    if (!failure.details.empty()) {
        throw failure;
    }
}

/// A folder that nobody may read, or whose path is too long, stays so, and its files are kept. After another error the
/// next look may find that they are gone.
void failIfReadAgain(Folders const& unreadable, common::RootPath const& root)
{
    for (OdString const& folder : unreadable) {
        std::error_code error;
        std::filesystem::directory_iterator const entries(root.pathTo(folder).ansi_str(), error);
        bool const stays = error == std::errc::permission_denied || error == std::errc::operation_not_permitted ||
                           error == std::errc::filename_too_long;
        if (!stays) {
            throw Failure(
                "The folder " + quoted(folder) + " could not be read" + (error ? ": " + error.message() : "") + ".",
                "Nothing has been committed; run the command again.");
        }
    }
}

/// What is behind a link is not in the working folder, and no removal either.
void failIfUnreachable(common::State const& state, Folders const& unreadable, common::RootPath const& root)
{
    FolderView view(root);
    for (common::StagedFile const& file : state.stagedFiles) {
        if (file.change == common::FileChange::removed) {
            continue;
        }
        Presence const presence = view.look(file.path).presence;
        if (isUnread(presence, file.path, unreadable)) {
            throw Failure(
                quoted(file.path) + " is staged, but its folder cannot be read.",
                "Check your permissions for it, or run 'tav unstage' for the file.");
        }
        if (presence == Presence::isBehindLink) {
            throw Failure(
                quoted(file.path) + " is staged, but a link has taken the place of its folder.",
                "Replace the link with the folder itself, or run 'tav unstage' for the file.");
        }
    }
}

/// Programs that save by renaming let a file be gone for a moment: that is no removal.
void failIfBack(std::vector<PlannedFile> const& plan, common::State const& state, common::RootPath const& root)
{
    std::set<OdString> const wanted = stagedPaths(state);
    for (PlannedFile const& file : plan) {
        bool const isNoticed = file.change == common::FileChange::removed && wanted.count(file.path) == 0;
        if (isNoticed && ut::FileName::fileExists(root.pathTo(file.path))) {
            throw Failure(
                "'" + file.path.ansi_str() + "' disappeared and came back; another program is probably saving it.",
                "Nothing has been committed; run the command again.");
        }
    }
}

void requireSound(OdString const& text, std::string const& what)
{
    wchar_t const* const begin = text.c_str();
    wchar_t const* const end = begin + text.getLength();
    if (!isSound(text) || std::find(begin, end, L'\0') != end) {
        throw Failure(what + " contains a NUL or an unpaired surrogate.", "Nothing has been committed; correct it.");
    }
}

/// What the server can only refuse must not get into the journal: it could never end. The files of the last commit come
/// from the database, which may come from anywhere.
void requireRecordable(NewCommit const& added)
{
    requireSound(added.commit.author, "The author");
    requireSound(added.commit.message, "The message");
    for (FileRecord const& file : added.files) {
        if (auto const fault = whyUnsafe(file.path)) {
            throw Failure(*fault, "Nothing has been committed; rename the file.");
        }
        if (!isContentUrl(file.url)) {
            throw Failure(
                "The last commit does not record a content for " + quoted(file.path) + ".", "Run 'tav verify'.");
        }
    }
    if (auto const fault = whyNotTree(added.files)) {
        throw Failure("A commit " + *fault + ".", "Nothing has been committed; commit the removal of one of them too.");
    }
}

void stageModified(FolderChanges const& changes, common::State& state)
{
    std::vector<common::StagedFile> files;
    for (auto const& file : changes.modified) {
        files.emplace_back(file.working.path, common::FileChange::modified);
    }
    stage(files, state);
}

/// What the commit changes here; `staging` is what is staged on the disk.
Operation operationOf(Draft const& draft, common::State const& staging, CommitOrder const& order, OdString const& hash)
{
    Operation operation;
    operation.kind = Kind::commit;
    operation.command = (order.replaced ? L"commit --amend -m " : L"commit -m ") + order.message;
    operation.phase = Phase::running;
    operation.before = {draft.database.currentCommit(), staging.head};
    operation.after = {hash, staging.head};
    common::State after = stagedPart(staging);
    applyIndexUpdates(draft.pending.files, after);
    operation.staging = stagingChange(staging, after);
    return operation;
}

/// Brings the contents into the storage, for good.
void keepContents(Draft& draft, std::vector<PlannedFile> const& plan)
{
    Tree const base = draft.files;
    LocalStorage storage(
        draft.root, {[&](OdString const& path) { return previousUrl(draft, base, path); },
                     [&](Digest const& digest) { return draft.database.urlOf(digest); },
                     [&](OdString const& path) { return similarFiles(draft.files, path); }});
    storeAll(draft, plan, storage);
    if (draft.files == base) {
        throw Failure("The staged files are the same as in the last commit.", "Run 'tav unstage --all' to clear it.");
    }
    readBack(draft, plan, storage);
}

/// Whether what is staged is what the commit has taken, whose index record is `record`; none for a removal.
bool isAsCommitted(common::StagedFile const& staged, std::optional<common::IndexData> const& record, FolderView& view)
{
    if (staged.change == common::FileChange::removed) {
        return !record;
    }
    auto const stamp = view.look(staged.path.ansi_str()).stamp;
    return !stamp || (record && record->lastChecked == static_cast<std::uint64_t>(stamp->modified));
}

/// The staged files that are not what was committed any more: a commit may wait for its server for days.
std::set<OdString> changedSince(IndexUpdates const& files, common::State const& state, common::RootPath const& root)
{
    std::set<OdString> changed;
    FolderView view(root);
    for (common::StagedFile const& staged : state.stagedFiles) {
        auto const file = files.find(staged.path);
        if (file != files.end() && !isAsCommitted(staged, file->second, view)) {
            changed.insert(staged.path);
        }
    }
    return changed;
}

/// Other files may have been staged since the commit began. The log says what it has taken of them, unless it has done
/// so before a crash.
void noteStaging(StagingChange const& change, common::State const& after, LocalDatabase& database)
{
    auto operation = database.operations().running();
    if (!operation || isEmpty(change)) {
        return;
    }
    database.operations().readDetails(*operation);
    if (!isOn(Side::after, operation->staging, after)) {
        WriteTransaction transaction(database.database());
        database.operations().setStaging(operation->id, change);
        transaction.commit();
    }
}

CommitRecord
finish(common::RootPath const& root, LocalDatabase& database, PendingCommit const& pending, NewCommit commit)
{
    Connection connection(database);
    commit.commit.number = sentNumber(commit, pending.document, database, connection);
    if (commit.commit.number != database.commits().lastWithoutGap() + 1) { // Others have committed meanwhile.
        fetchHistory(root, database, connection, Compared::everything);
    }
    enter(commit, pending, database);
    changeState(root, [&](common::Cache& cache) {
        std::set<OdString> const left = changedSince(pending.files, cache.read(), root);
        common::State const before = stagedPart(cache.read());
        applyIndexUpdates(pending.files, cache.write(), left);
        noteStaging(stagingChange(before, cache.read()), cache.read(), database);
    });
    endOperation(database);
    return commit.commit;
}

} // namespace

void requireCommittable(common::RootPath const& root, LocalDatabase& database)
{
    requireNoConflicts(root);
    Connection server(database); // Without one there is nothing to begin.
    fetchHistory(root, database, server, Compared::theEnd);
    failIfNotAtTheEnd(database, readState(root)->read().head);
}

Committed commit(common::RootPath const& root, LocalDatabase& database, CommitOrder const& order, std::uint64_t start)
{
    requireCommittable(root, database);
    auto const cache = readState(root);
    common::State state = cache->read();
    requireReplacedIsCurrent(order, database);
    Draft draft{root, database, start, database.commits().files(database.currentCommit()), {}, {}};
    FolderChanges const changes = compareWithBase(draft);
    if (order.takesModified) {
        stageModified(changes, state); // In memory: a commit that fails has staged nothing.
    }
    failIfReadAgain(changes.unreadable, root);
    failIfUnreachable(state, changes.unreadable, root);
    Renames const renames = findRenames(changes, state, database, root);
    std::vector<PlannedFile> plan = planCommit(state, changes, renames, draft.files, root);
    if (!order.only.empty()) {
        leaveOthers(order.only, plan);
    }
    planMissing(plan, state, formerPathsOfMoves(renames, database, root), order.missing, root);
    if (plan.empty()) {
        auto const last = lastCommitIfOf(order, database);
        if (last && !hasChanges(changes)) {
            return {*last, false};
        }
        if (last || !order.replaced) {
            failForNothing(changes, root);
        }
    }
    checkNames(plan);
    for (PlannedFile const& file : plan) {
        if (!file.previousPath.isEmpty()) {
            draft.previous.emplace(file.path, file.previousPath);
        }
    }
    if (!plan.empty()) {
        keepContents(draft, plan);
    }
    if (order.replaced) {
        failIfNothingIsLeft(draft, *order.replaced);
    }
    failIfBack(plan, state, root);
    NewCommit added = newCommit(draft, order, state.head);
    draft.pending.document = commitInfoDocument(added);
    requireRecordable(added);
    WriteTransaction transaction(database.database());
    beginCommit(operationOf(draft, cache->read(), order, added.commit.hash), draft.pending, database);
    database.addVerified(settledFiles(std::move(draft.verified), start));
    transaction.commit();
    return {finish(root, database, draft.pending, std::move(added)), true};
}

CommitRecord finishCommit(common::RootPath const& root, LocalDatabase& database, PendingCommit const& pending)
{
    return finish(root, database, pending, readCommitInfo(pending.document));
}

} // namespace tav
