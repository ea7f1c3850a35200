#include "host/repository/shelves.h"

#include "host/errors/failure.h"
#include "host/repository/operation.h"

#include <ctime>
#include <string>

namespace tav {

namespace {

constexpr char const* kTables = R"(
CREATE TABLE shelves (
    id INTEGER PRIMARY KEY AUTOINCREMENT,
    date INTEGER NOT NULL,
    message TEXT NOT NULL,
    commit_hash TEXT NOT NULL,
    branch TEXT NOT NULL,
    made_by INTEGER NOT NULL,
    taken_by INTEGER NOT NULL
);
CREATE TABLE shelf_files (
    shelf INTEGER NOT NULL REFERENCES shelves,
    path TEXT NOT NULL,
    base TEXT NOT NULL,
    content TEXT NOT NULL,
    permissions INTEGER NOT NULL,
    PRIMARY KEY (shelf, path)
) WITHOUT ROWID;
CREATE TABLE shelf_staging (
    shelf INTEGER NOT NULL REFERENCES shelves,
    position INTEGER NOT NULL,
    path TEXT NOT NULL,
    change INTEGER NOT NULL,
    PRIMARY KEY (shelf, position)
) WITHOUT ROWID;
CREATE TABLE shelf_renames (
    shelf INTEGER NOT NULL REFERENCES shelves,
    path TEXT NOT NULL,
    previous TEXT NOT NULL,
    PRIMARY KEY (shelf, path)
) WITHOUT ROWID;
)";

// The numbers are those of `Phase::undone` and `Phase::superseded`.
constexpr char const* kAll = R"(
SELECT id, date, message, commit_hash, branch, (SELECT count(*) FROM shelf_files WHERE shelf = id) FROM shelves
WHERE made_by NOT IN (SELECT id FROM operations WHERE phase IN (3, 5))
AND (taken_by = 0 OR taken_by IN (SELECT id FROM operations WHERE phase IN (3, 5))) ORDER BY id DESC)";

/// The file may come from anywhere.
common::FileChange changeOf(std::int64_t number, Database const& database)
{
    if (number < 0 || number > static_cast<std::int64_t>(common::FileChange::removed)) {
        throw Failure(
            "The shelves in '" + database.path() + "' cannot be read.",
            "Put a copy of that file from a backup in its place.");
    }
    return static_cast<common::FileChange>(number);
}

} // namespace

void Shelves::create(Database& database)
{
    database.run(kTables);
}

std::int64_t Shelves::add(Shelf const& shelf, std::int64_t operation)
{
    Statement row = database_->prepare("INSERT INTO shelves VALUES (NULL, ?, ?, ?, ?, ?, 0)");
    row.with(static_cast<std::int64_t>(std::time(nullptr))).with(shelf.message).with(shelf.commit);
    row.with(shelf.branch).with(operation).run();
    Statement last = database_->prepare("SELECT last_insert_rowid()");
    std::int64_t const id = last.next() ? last.integer(0) : 0;
    Statement files = database_->prepare("INSERT INTO shelf_files VALUES (?, ?, ?, ?, ?)");
    for (ShelvedFile const& file : shelf.files) {
        files.with(id).with(file.path).with(file.base).with(file.content);
        files.with(static_cast<std::int64_t>(file.permissions)).run();
    }
    Statement staged = database_->prepare("INSERT INTO shelf_staging VALUES (?, ?, ?, ?)");
    std::int64_t position = 0;
    for (common::StagedFile const& file : shelf.staging.stagedFiles) {
        staged.with(id).with(position++).with(file.path).with(static_cast<std::int64_t>(file.change)).run();
    }
    Statement renames = database_->prepare("INSERT INTO shelf_renames VALUES (?, ?, ?)");
    for (auto const& [path, previous] : shelf.staging.renames) {
        renames.with(id).with(path).with(previous).run();
    }
    return id;
}

void Shelves::take(std::int64_t id, std::int64_t operation)
{
    Statement row = database_->prepare("UPDATE shelves SET taken_by = ? WHERE id = ?");
    row.with(operation).with(id).run();
}

std::vector<Shelf> Shelves::all() const
{
    std::vector<Shelf> shelves;
    Statement rows = database_->prepare(kAll);
    while (rows.next()) {
        Shelf shelf;
        shelf.id = rows.integer(0);
        shelf.date = rows.integer(1);
        shelf.message = rows.text(2);
        shelf.commit = rows.text(3);
        shelf.branch = rows.text(4);
        shelf.fileCount = static_cast<std::size_t>(rows.integer(5));
        shelves.push_back(std::move(shelf));
    }
    return shelves;
}

void Shelves::readDetails(Shelf& shelf) const
{
    Statement files =
        database_->prepare("SELECT path, base, content, permissions FROM shelf_files WHERE shelf = ? ORDER BY path");
    files.with(shelf.id);
    while (files.next()) {
        shelf.files.push_back(
            {files.text(0), files.text(1), files.text(2), static_cast<std::uint32_t>(files.integer(3))});
    }
    Statement staged = database_->prepare("SELECT path, change FROM shelf_staging WHERE shelf = ? ORDER BY position");
    staged.with(shelf.id);
    while (staged.next()) {
        shelf.staging.stagedFiles.emplace_back(staged.text(0), changeOf(staged.integer(1), *database_));
    }
    Statement renames = database_->prepare("SELECT path, previous FROM shelf_renames WHERE shelf = ?");
    renames.with(shelf.id);
    while (renames.next()) {
        shelf.staging.renames.emplace(renames.text(0), renames.text(1));
    }
}

std::vector<OdString> Shelves::urls() const
{
    Statement rows = database_->prepare(
        "SELECT base FROM shelf_files WHERE base <> '' UNION SELECT content FROM shelf_files WHERE content <> ''");
    std::vector<OdString> urls;
    while (rows.next()) {
        urls.push_back(rows.text(0));
    }
    return urls;
}

OdString Shelves::pathAt(OdString const& url) const
{
    Statement row = database_->prepare("SELECT path FROM shelf_files WHERE base = ? OR content = ? ORDER BY path");
    return row.with(url).with(url).next() ? row.text(0) : OdString();
}

void Shelves::forget(std::int64_t operation, Database& database)
{
    Statement gone = database.prepare(R"(
        SELECT id FROM shelves WHERE (made_by = ?1 AND ?1 IN (SELECT id FROM operations WHERE phase IN (3, 5)))
        OR (taken_by = ?1 AND ?1 NOT IN (SELECT id FROM operations WHERE phase IN (3, 5))))");
    gone.with(operation);
    std::vector<std::int64_t> ids;
    while (gone.next()) {
        ids.push_back(gone.integer(0));
    }
    for (std::int64_t const id : ids) {
        for (char const* const statement :
             {"DELETE FROM shelf_files WHERE shelf = ?", "DELETE FROM shelf_staging WHERE shelf = ?",
              "DELETE FROM shelf_renames WHERE shelf = ?", "DELETE FROM shelves WHERE id = ?"}) {
            Statement row = database.prepare(statement);
            row.with(id).run();
        }
    }
    Statement free = database.prepare("UPDATE shelves SET taken_by = 0 WHERE taken_by = ?");
    free.with(operation).run();
}

} // namespace tav
