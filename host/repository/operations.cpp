#include "host/repository/operations.h"

#include "host/errors/failure.h"
#include "host/repository/earlier_journal.h"
#include "host/repository/shelves.h"

#include <ctime>
#include <string>
#include <string_view>

namespace tav {

namespace {

constexpr char const* kTables = R"(
CREATE TABLE operations (
    id INTEGER PRIMARY KEY AUTOINCREMENT,
    kind INTEGER NOT NULL,
    command TEXT NOT NULL,
    date INTEGER NOT NULL,
    phase INTEGER NOT NULL,
    commit_before TEXT NOT NULL,
    branch_before TEXT NOT NULL,
    commit_after TEXT NOT NULL,
    branch_after TEXT NOT NULL,
    moved_from TEXT NOT NULL,
    moved_to TEXT NOT NULL,
    staging_position INTEGER NOT NULL,
    staging_behind INTEGER NOT NULL,
    document TEXT NOT NULL,
    is_written INTEGER NOT NULL
);
CREATE UNIQUE INDEX one_under_way ON operations (phase IN (0, 2, 4)) WHERE phase IN (0, 2, 4);
CREATE TABLE operation_files (
    operation INTEGER NOT NULL REFERENCES operations,
    path TEXT NOT NULL,
    before TEXT NOT NULL,
    after TEXT NOT NULL,
    permissions INTEGER NOT NULL,
    PRIMARY KEY (operation, path)
) WITHOUT ROWID;
CREATE TABLE operation_staging (
    operation INTEGER NOT NULL REFERENCES operations,
    side INTEGER NOT NULL,
    position INTEGER NOT NULL,
    path TEXT NOT NULL,
    change INTEGER NOT NULL,
    PRIMARY KEY (operation, side, position)
) WITHOUT ROWID;
CREATE TABLE operation_renames (
    operation INTEGER NOT NULL REFERENCES operations,
    path TEXT NOT NULL,
    before TEXT NOT NULL,
    after TEXT NOT NULL,
    PRIMARY KEY (operation, path)
) WITHOUT ROWID;
CREATE TABLE pending_begun (commit_hash TEXT PRIMARY KEY) WITHOUT ROWID;
CREATE TABLE pending_contents (url TEXT PRIMARY KEY, digest TEXT NOT NULL, size INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE pending_files (
    path TEXT PRIMARY KEY,
    is_known INTEGER NOT NULL,
    time INTEGER NOT NULL,
    is_modified INTEGER NOT NULL
) WITHOUT ROWID;
)";

constexpr char const* kColumns =
    "SELECT id, kind, command, date, phase, commit_before, branch_before, commit_after, branch_after, moved_from, "
    "moved_to, staging_position, staging_behind FROM operations ";

constexpr std::int64_t kKeptFor = std::int64_t{30} * 24 * 60 * 60; // seconds
constexpr std::int64_t kMost = 10'000;
constexpr std::int64_t kMostRemovedAtOnce = 100; // No command pays for all that has piled up.

OdString const kSettingOfEarlierVersions = L"unfinished";

template <class Enum>
std::int64_t numberOf(Enum value)
{
    return static_cast<std::int64_t>(value);
}

[[noreturn]] void failUnreadable(Database const& database)
{
    throw Failure(
        "The log of operations in '" + database.path() + "' cannot be read.",
        "Put a copy of that file from a backup in its place.");
}

/// The file may come from anywhere.
template <class Enum>
Enum valueOf(std::int64_t number, Enum last, Database const& database)
{
    if (number < 0 || number > numberOf(last)) {
        failUnreadable(database);
    }
    return static_cast<Enum>(number);
}

Operation operationIn(Statement const& row, Database const& database)
{
    Operation operation;
    operation.id = row.integer(0);
    operation.kind = valueOf(row.integer(1), Kind::rename, database);
    operation.command = row.text(2);
    operation.date = row.integer(3);
    operation.phase = valueOf(row.integer(4), Phase::superseded, database);
    operation.before = {row.text(5), row.text(6)};
    operation.after = {row.text(7), row.text(8)};
    operation.movedFrom = row.text(9);
    operation.movedTo = row.text(10);
    operation.staging.position = static_cast<std::size_t>(row.integer(11));
    operation.staging.behind = static_cast<std::size_t>(row.integer(12));
    return operation;
}

Operation operationOf(PendingOperation const& pending)
{
    Operation operation;
    operation.phase = Phase::running;
    auto const* const checkout = std::get_if<PendingCheckout>(&pending);
    operation.kind = checkout ? Kind::move : Kind::commit;
    if (checkout) {
        operation.after = {checkout->target, checkout->branch};
    }
    return operation;
}

OdString notedByEarlierVersion(Database const& database)
{
    Statement row = database.prepare("SELECT value FROM settings WHERE key = ?");
    return row.with(kSettingOfEarlierVersions).next() ? row.text(0) : OdString();
}

void takeOver(PendingOperation const& pending, Operations& operations)
{
    operations.add(operationOf(pending));
    if (auto const* const checkout = std::get_if<PendingCheckout>(&pending)) {
        operations.setPending(*checkout);
    } else if (auto const* const commit = std::get_if<PendingCommit>(&pending)) {
        operations.setPending(*commit);
    }
}

} // namespace

void Operations::create(Database& database)
{
    database.run(kTables);
    OdString const noted = notedByEarlierVersion(database);
    if (!noted.isEmpty()) {
        Operations operations(database);
        takeOver(readEarlierJournal(noted, database.path()), operations);
    }
    Statement remove = database.prepare("DELETE FROM settings WHERE key = ?");
    remove.with(kSettingOfEarlierVersions).run();
}

PendingOperation Operations::pendingIn(Database const& database)
{
    OdString const noted = notedByEarlierVersion(database);
    return noted.isEmpty() ? PendingOperation() : readEarlierJournal(noted, database.path());
}

std::int64_t Operations::add(Operation const& operation)
{
    Statement supersede = database_->prepare("UPDATE operations SET phase = ? WHERE phase = ?");
    supersede.with(numberOf(Phase::superseded)).with(numberOf(Phase::undone)).run();
    removeOld();
    Statement row =
        database_->prepare("INSERT INTO operations VALUES (NULL, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, 0, 0, '', 0)");
    row.with(numberOf(operation.kind)).with(operation.command).with(static_cast<std::int64_t>(std::time(nullptr)));
    row.with(numberOf(operation.phase)).with(operation.before.commit).with(operation.before.branch);
    row.with(operation.after.commit).with(operation.after.branch).with(operation.movedFrom).with(operation.movedTo);
    row.run();
    Statement last = database_->prepare("SELECT last_insert_rowid()");
    std::int64_t const id = last.next() ? last.integer(0) : 0;
    setStaging(id, operation.staging);
    setFiles(id, operation.files);
    return id;
}

void Operations::setFiles(std::int64_t id, std::vector<FileContents> const& files)
{
    Statement row = database_->prepare(R"(
        INSERT INTO operation_files VALUES (?, ?, ?, ?, ?)
        ON CONFLICT DO UPDATE SET before = excluded.before, after = excluded.after)");
    for (FileContents const& file : files) {
        row.with(id).with(file.path).with(file.before).with(file.after);
        row.with(static_cast<std::int64_t>(file.permissions)).run();
    }
}

void Operations::setStaging(std::int64_t id, StagingChange const& change)
{
    Statement place = database_->prepare("UPDATE operations SET staging_position = ?, staging_behind = ? WHERE id = ?");
    place.with(static_cast<std::int64_t>(change.position)).with(static_cast<std::int64_t>(change.behind)).with(id);
    place.run();
    for (char const* const table : {"operation_staging", "operation_renames"}) {
        removeFrom(table, id);
    }
    Statement row = database_->prepare("INSERT INTO operation_staging VALUES (?, ?, ?, ?, ?)");
    for (Side const side : {Side::before, Side::after}) {
        std::int64_t position = 0;
        for (common::StagedFile const& file : side == Side::before ? change.before : change.after) {
            row.with(id).with(numberOf(side)).with(position++).with(file.path).with(numberOf(file.change)).run();
        }
    }
    Statement renamed = database_->prepare("INSERT INTO operation_renames VALUES (?, ?, ?, ?)");
    for (auto const& [path, previous] : change.renames) {
        renamed.with(id).with(path).with(previous.first).with(previous.second).run();
    }
}

void Operations::setPhase(std::int64_t id, Phase phase)
{
    Statement row = database_->prepare("UPDATE operations SET phase = ? WHERE id = ?");
    row.with(numberOf(phase)).with(id).run();
}

void Operations::remove(std::int64_t id)
{
    Shelves::forget(id, *database_);
    for (char const* const table : {"operation_files", "operation_staging", "operation_renames"}) {
        removeFrom(table, id);
    }
    Statement row = database_->prepare("DELETE FROM operations WHERE id = ?");
    row.with(id).run();
}

void Operations::removeFrom(char const* table, std::int64_t id)
{
    Statement rows = database_->prepare(("DELETE FROM " + std::string(table) + " WHERE operation = ?").c_str());
    rows.with(id).run();
}

/// Called before the newest one is added, which stays therefore whatever the clock says.
void Operations::removeOld()
{
    Statement rows = database_->prepare(R"(
        SELECT id FROM operations WHERE phase NOT IN (0, 2, 4)
        AND (date < ?1 OR id <= (SELECT max(id) FROM operations) - ?2) ORDER BY id LIMIT ?3)");
    rows.with(static_cast<std::int64_t>(std::time(nullptr)) - kKeptFor).with(kMost - 1).with(kMostRemovedAtOnce);
    std::vector<std::int64_t> old;
    while (rows.next()) {
        old.push_back(rows.integer(0));
    }
    for (std::int64_t const id : old) {
        remove(id);
    }
}

std::optional<Operation> Operations::running() const
{
    return one("WHERE phase IN (0, 2, 4)");
}

std::optional<Operation> Operations::last(Phase phase) const
{
    return one(("WHERE phase = " + std::to_string(numberOf(phase)) + " ORDER BY id DESC LIMIT 1").c_str());
}

std::optional<Operation> Operations::first(Phase phase) const
{
    return one(("WHERE phase = " + std::to_string(numberOf(phase)) + " ORDER BY id LIMIT 1").c_str());
}

std::optional<Operation> Operations::one(char const* condition) const
{
    Statement row = database_->prepare((std::string(kColumns) + condition).c_str());
    return row.next() ? std::optional(operationIn(row, *database_)) : std::nullopt;
}

std::vector<Operation> Operations::latest(std::size_t count) const
{
    Statement rows = database_->prepare((std::string(kColumns) + "ORDER BY id DESC LIMIT ?").c_str());
    rows.with(static_cast<std::int64_t>(count));
    std::vector<Operation> operations;
    while (rows.next()) {
        operations.push_back(operationIn(rows, *database_));
    }
    return operations;
}

void Operations::readDetails(Operation& operation) const
{
    Statement files = database_->prepare(
        "SELECT path, before, after, permissions FROM operation_files WHERE operation = ? ORDER BY path");
    files.with(operation.id);
    while (files.next()) {
        operation.files.push_back(
            {files.text(0), files.text(1), files.text(2), static_cast<std::uint32_t>(files.integer(3))});
    }
    Statement staged = database_->prepare(
        "SELECT side, path, change FROM operation_staging WHERE operation = ? ORDER BY side, position");
    staged.with(operation.id);
    while (staged.next()) {
        auto& list = staged.integer(0) == numberOf(Side::before) ? operation.staging.before : operation.staging.after;
        list.emplace_back(staged.text(1), valueOf(staged.integer(2), common::FileChange::removed, *database_));
    }
    Statement renames = database_->prepare("SELECT path, before, after FROM operation_renames WHERE operation = ?");
    renames.with(operation.id);
    while (renames.next()) {
        operation.staging.renames.emplace(renames.text(0), std::pair(renames.text(1), renames.text(2)));
    }
}

OdString Operations::pathAt(OdString const& url) const
{
    Statement row = database_->prepare("SELECT path FROM operation_files WHERE before = ? OR after = ? ORDER BY path");
    return row.with(url).with(url).next() ? row.text(0) : OdString();
}

std::vector<OdString> Operations::urls() const
{
    Statement rows = database_->prepare(R"(
        SELECT before FROM operation_files WHERE before <> ''
        UNION SELECT after FROM operation_files WHERE after <> '' ORDER BY 1)");
    std::vector<OdString> urls;
    while (rows.next()) {
        urls.push_back(rows.text(0));
    }
    return urls;
}

PendingOperation Operations::pending() const
{
    auto const operation = running();
    if (!operation) {
        return {};
    }
    if (operation->kind == Kind::commit) {
        return pendingCommit();
    }
    Position const& target = operation->phase == Phase::undoing ? operation->before : operation->after;
    Statement written = database_->prepare("SELECT is_written FROM operations WHERE id = ?");
    PendingCheckout checkout{
        target.commit, target.branch, written.with(operation->id).next() && written.integer(0) != 0};
    Statement begun = database_->prepare("SELECT commit_hash FROM pending_begun");
    while (begun.next()) {
        checkout.begun.push_back(begun.text(0));
    }
    checkout.files = indexUpdates();
    return checkout;
}

PendingCommit Operations::pendingCommit() const
{
    PendingCommit commit;
    Statement document = database_->prepare("SELECT document FROM operations WHERE phase IN (0, 2, 4)");
    commit.document = document.next() ? document.text(0) : OdString();
    Statement contents = database_->prepare("SELECT url, digest, size FROM pending_contents ORDER BY url");
    while (contents.next()) {
        auto const digest = digestFromHex(contents.bytes(1));
        if (!digest) {
            failUnreadable(*database_);
        }
        commit.contents.push_back({contents.text(0), *digest, static_cast<std::uint64_t>(contents.integer(2))});
    }
    commit.files = indexUpdates();
    return commit;
}

IndexUpdates Operations::indexUpdates() const
{
    IndexUpdates files;
    Statement rows = database_->prepare("SELECT path, is_known, time, is_modified FROM pending_files");
    while (rows.next()) {
        std::optional<common::IndexData> record;
        if (rows.integer(1) != 0) {
            record = {static_cast<std::uint64_t>(rows.integer(2)), rows.integer(3) != 0};
        }
        files.emplace(rows.text(0), record);
    }
    return files;
}

void Operations::setPending(PendingCommit const& commit)
{
    clearPending();
    Statement document = database_->prepare("UPDATE operations SET document = ? WHERE phase IN (0, 2, 4)");
    document.with(commit.document).run();
    Statement contents = database_->prepare("INSERT OR REPLACE INTO pending_contents VALUES (?, ?, ?)");
    for (NewContent const& content : commit.contents) {
        contents.with(content.url).with(std::string_view(hexOf(content.digest)));
        contents.with(static_cast<std::int64_t>(content.size)).run();
    }
    put(commit.files);
}

void Operations::setPending(PendingCheckout const& checkout)
{
    clearPending();
    Statement written = database_->prepare("UPDATE operations SET is_written = ? WHERE phase IN (0, 2, 4)");
    written.with(std::int64_t{checkout.isWritten}).run();
    Statement begun = database_->prepare("INSERT OR REPLACE INTO pending_begun VALUES (?)");
    for (OdString const& commit : checkout.begun) {
        begun.with(commit).run();
    }
    put(checkout.files);
}

void Operations::put(IndexUpdates const& files)
{
    Statement row = database_->prepare("INSERT INTO pending_files VALUES (?, ?, ?, ?)");
    for (auto const& [path, record] : files) {
        row.with(path).with(std::int64_t{record.has_value()});
        row.with(record ? static_cast<std::int64_t>(record->lastChecked) : 0);
        row.with(std::int64_t{record && record->modified}).run();
    }
}

void Operations::clearPending()
{
    database_->run("DELETE FROM pending_begun; DELETE FROM pending_contents; DELETE FROM pending_files; "
                   "UPDATE operations SET document = '', is_written = 0 WHERE document <> '' OR is_written");
}

} // namespace tav
