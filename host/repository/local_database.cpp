#include "host/repository/local_database.h"

#include "host/errors/failure.h"
#include "host/history/last_changes.h"
#include "host/repository/identity.h"
#include "host/text/utf8.h"

#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"

#include <array>
#include <cstddef>
#include <cstdlib>
#include <filesystem>
#include <string>

namespace tav {

namespace {

constexpr char const* kFirstTables = R"(
CREATE TABLE settings (key TEXT PRIMARY KEY, value TEXT NOT NULL) WITHOUT ROWID;
CREATE TABLE contents (url TEXT PRIMARY KEY, digest TEXT NOT NULL, size INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX contents_by_digest ON contents (digest);
)";

void makeFirstTables(Database& database)
{
    CommitTables::create(database);
    database.run(kFirstTables);
}

/// From here on objects may build on others. The tables stay as they are: the version alone keeps an earlier tav from
/// taking such objects for damaged, and their bases for what nobody needs.
void allowBasesOfObjects(Database& /*unused*/) {}

/// Each makes the next version out of the one before; a new file is version 0. Steps are added and never changed: files
/// that earlier versions of tav made have to pass them all.
constexpr std::array kSteps = {makeFirstTables,     VerifiedFiles::create, CommitTables::createIndex,
                               LastChanges::create, allowBasesOfObjects,   Operations::create,
                               Shelves::create};

constexpr std::int64_t kVersion = kSteps.size();
constexpr std::int64_t kFirstWithVerifiedFiles = 2;
constexpr std::int64_t kFirstWithOperations = 6;
constexpr std::int64_t kFirstWithShelves = 7;
constexpr char const* kAdviceForDamage =
    "Put a copy of it from a backup in its place, or move it away and run 'tav init', which makes it again from the "
    "server.";

void failIfLost(common::RootPath const& root)
{
    if (LocalDatabase::isLost(root)) {
        throw Failure(
            "The database '" + root.dbPath().ansi_str() + "' is missing or empty, though versions are stored here.",
            "Run 'tav init', with --server FOLDER where the history is not in the default place.");
    }
}

std::string pathToOpen(common::RootPath const& root)
{
    failIfLost(root);
    bool const isThere = ut::FileName::fileExists(root.dbPath());
    return isThere ? root.dbPath().ansi_str() : ":memory:";
}

} // namespace

LocalDatabase LocalDatabase::make(common::RootPath const& root)
{
    failIfLost(root);
    return {root.dbPath().ansi_str(), Use::changing, &root};
}

LocalDatabase LocalDatabase::makeAt(std::string const& path)
{
    return {path, Use::changing, nullptr};
}

bool LocalDatabase::isLost(common::RootPath const& root)
{
    std::error_code error;
    auto const size = std::filesystem::file_size(root.dbPath().ansi_str(), error);
    bool const isThere = !error && size > 0;
    return !isThere && (ut::Dir::exists(root.tavPath() + L"/objects") || ut::Dir::exists(root.tavPath() + L"/tf"));
}

LocalDatabase LocalDatabase::openForChanges(common::RootPath const& root)
{
    return {pathToOpen(root), Use::changing, &root};
}

LocalDatabase LocalDatabase::open(common::RootPath const& root)
{
    return {pathToOpen(root), Use::reading, &root};
}

LocalDatabase::LocalDatabase(std::string const& path, Use use, common::RootPath const* folder)
    : database_(path, kAdviceForDamage)
    , commits_(database_, 1)
    , verifiedFiles_(database_)
    , operations_(database_)
    , shelves_(database_)
{
    std::int64_t const version = database_.version();
    if (version > kVersion) {
        throw Failure("The database '" + path + "' was written by a newer tav.", "Use that one.");
    }
    if (version == 0 || (version < kVersion && use == Use::changing)) {
        migrate();
    }
    if (folder) {
        requireIdentity(*folder, repositoryId());
    }
}

void LocalDatabase::migrate()
{
    WriteTransaction transaction(database_);
    for (std::int64_t version = database_.version(); version < kVersion; ++version) { // Another process may have been
        kSteps[static_cast<std::size_t>(version)](database_);                         // faster.
        database_.setVersion(version + 1);
    }
    transaction.commit();
}

VerifiedFileList LocalDatabase::verifiedFiles() const
{
    return database_.version() < kFirstWithVerifiedFiles ? VerifiedFileList() : verifiedFiles_.all();
}

void LocalDatabase::addVerified(VerifiedFileList const& files)
{
    verifiedFiles_.put(files);
}

bool LocalDatabase::hasOperations() const
{
    return database_.version() >= kFirstWithOperations;
}

bool LocalDatabase::hasShelves() const
{
    return database_.version() >= kFirstWithShelves;
}

PendingOperation LocalDatabase::pendingOperation() const
{
    return hasOperations() ? operations_.pending() : Operations::pendingIn(database_);
}

void LocalDatabase::failIfDamaged() const
{
    if (std::string const damage = database_.damage(); !damage.empty()) {
        throw Failure("The database '" + path() + "' is damaged: " + damage + ".", kAdviceForDamage);
    }
}

void LocalDatabase::setServer(OdString const& folder, OdString const& repositoryId)
{
    WriteTransaction transaction(database_);
    setValue("server", folder);
    setValue("repository", repositoryId);
    transaction.commit();
}

std::int64_t LocalDatabase::turnedOver() const
{
    return std::strtoll(value("turned over").ansi_str().c_str(), nullptr, 10);
}

void LocalDatabase::setTurnedOver(std::int64_t commit)
{
    setValue("turned over", fromUtf8(std::to_string(commit)));
}

OdString LocalDatabase::urlOf(Digest const& digest) const
{
    Statement row = database_.prepare("SELECT url FROM contents WHERE digest = ? ORDER BY url LIKE 'tf:%' DESC, url");
    return row.with(std::string_view(hexOf(digest))).next() ? row.text(0) : OdString();
}

OdString LocalDatabase::committedUrlOf(Digest const& digest) const
{
    Statement row = database_.prepare("SELECT url FROM contents WHERE digest = ?");
    return row.with(std::string_view(hexOf(digest))).next() ? row.text(0) : OdString();
}

std::vector<OdString> LocalDatabase::contents() const
{
    Statement rows = database_.prepare("SELECT url FROM contents ORDER BY url");
    std::vector<OdString> urls;
    while (rows.next()) {
        urls.push_back(rows.text(0));
    }
    return urls;
}

std::optional<std::uint64_t> LocalDatabase::sizeOf(OdString const& url) const
{
    Statement row = database_.prepare("SELECT size FROM contents WHERE url = ?");
    return row.with(url).next() ? std::optional(static_cast<std::uint64_t>(row.integer(0))) : std::nullopt;
}

void LocalDatabase::addContent(OdString const& url, Digest const& digest, std::uint64_t size)
{
    Statement row = database_.prepare("INSERT OR REPLACE INTO contents VALUES (?, ?, ?)");
    row.with(url).with(std::string_view(hexOf(digest))).with(static_cast<std::int64_t>(size)).run();
}

OdString LocalDatabase::value(char const* key) const
{
    Statement row = database_.prepare("SELECT value FROM settings WHERE key = ?");
    return row.with(fromUtf8(key)).next() ? row.text(0) : OdString();
}

void LocalDatabase::setValue(char const* key, OdString const& value)
{
    Statement row = database_.prepare("INSERT OR REPLACE INTO settings VALUES (?, ?)");
    row.with(fromUtf8(key)).with(value).run();
}

} // namespace tav
