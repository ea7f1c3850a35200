#include "host/repository/local_database.h"

#include "host/failure.h"
#include "host/text/wide.h"

#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"

#include <filesystem>

namespace tav {

namespace {

constexpr std::int64_t kVersion = 1;

constexpr char const* kTables = R"(
CREATE TABLE settings (key TEXT PRIMARY KEY, value TEXT NOT NULL) WITHOUT ROWID;
CREATE TABLE contents (url TEXT PRIMARY KEY, digest TEXT NOT NULL, size INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX contents_by_digest ON contents (digest);
)";

void makeTables(Database& database)
{
    Change change(database);
    if (database.version() == 0) { // Another process may have been faster.
        CommitTables::create(database);
        database.run(kTables);
        database.setVersion(kVersion);
    }
    change.commit();
}

/// A database that is missing beside stored contents has been lost: a new one would hide the history.
void failIfLost(common::RootPath const& root)
{
    std::error_code error;
    auto const size = std::filesystem::file_size(root.dbPath().ansi_str(), error);
    bool const isThere = !error && size > 0;
    bool const hasContents = ut::Dir::exists(root.tavPath() + L"/objects") || ut::Dir::exists(root.tavPath() + L"/tf");
    if (!isThere && hasContents) {
        throw Failure(
            "The database '" + root.dbPath().ansi_str() + "' is missing or empty, though versions are stored here.",
            "Put a copy of it from a backup in its place.");
    }
}

} // namespace

LocalDatabase LocalDatabase::make(common::RootPath const& root)
{
    failIfLost(root);
    return LocalDatabase(root.dbPath().ansi_str());
}

LocalDatabase LocalDatabase::open(common::RootPath const& root)
{
    failIfLost(root);
    bool const isThere = ut::FileName::fileExists(root.dbPath());
    return LocalDatabase(isThere ? root.dbPath().ansi_str() : ":memory:");
}

LocalDatabase::LocalDatabase(std::string const& path) : database_(path), commits_(database_, 1)
{
    std::int64_t const version = database_.version();
    if (version == 0) {
        makeTables(database_);
    } else if (version > kVersion) {
        throw Failure("The database '" + path + "' was written by a newer tav.", "Use that one.");
    }
}

void LocalDatabase::setServer(OdString const& folder, OdString const& repositoryId)
{
    Change change(database_);
    setValue("server", folder);
    setValue("repository", repositoryId);
    change.commit();
}

OdString LocalDatabase::urlOf(OdString const& digest) const
{
    Statement row = database_.prepare("SELECT url FROM contents WHERE digest = ? AND url LIKE 'tf:%' ORDER BY url");
    return row.with(digest).next() ? row.text(0) : OdString();
}

bool LocalDatabase::keeps(OdString const& digest) const
{
    Statement row = database_.prepare("SELECT 1 FROM contents WHERE digest = ?");
    return row.with(digest).next();
}

std::optional<std::uint64_t> LocalDatabase::sizeOf(OdString const& url) const
{
    Statement row = database_.prepare("SELECT size FROM contents WHERE url = ?");
    return row.with(url).next() ? std::optional(static_cast<std::uint64_t>(row.integer(0))) : std::nullopt;
}

void LocalDatabase::addContent(OdString const& url, OdString const& digest, std::uint64_t size)
{
    Statement row = database_.prepare("INSERT OR REPLACE INTO contents VALUES (?, ?, ?)");
    row.with(url).with(digest).with(static_cast<std::int64_t>(size)).run();
}

OdString LocalDatabase::value(char const* key) const
{
    Statement row = database_.prepare("SELECT value FROM settings WHERE key = ?");
    return row.with(wide(key)).next() ? row.text(0) : OdString();
}

void LocalDatabase::setValue(char const* key, OdString const& value)
{
    Statement row = database_.prepare("INSERT OR REPLACE INTO settings VALUES (?, ?)");
    row.with(wide(key)).with(value).run();
}

} // namespace tav
