#include "host/server/sqlite_history.h"

#include "host/errors/failure.h"
#include "host/server/content_tables.h"
#include "host/text/characters.h"

#include <utility>

namespace tav {

namespace {

constexpr std::int64_t kTablesVersion = 3;
constexpr std::int64_t kFirstWithDelivered = 2;
constexpr std::int64_t kFirstWithContents = 3;

/// Up to which number commits have been handed out, of each repository: nobody but who made them has those behind it.
constexpr char const* kDelivered = "CREATE TABLE delivered (repository INTEGER PRIMARY KEY, number INTEGER NOT NULL)";

void createTables(Database& database)
{
    database.run(kDelivered);
    database.run("CREATE TABLE repositories (key INTEGER PRIMARY KEY, id TEXT NOT NULL UNIQUE, name TEXT NOT NULL)");
    CommitTables::create(database);
    ContentTables::create(database);
    database.setVersion(kTablesVersion);
}

/// Two processes may find the file new at the same time: the one that comes second looks again.
void prepareTables(Database& database)
{
    if (database.version() == 0) {
        WriteTransaction transaction(database);
        if (database.version() == 0) {
            createTables(database);
        }
        transaction.commit();
    }
    if (database.version() > kTablesVersion) {
        throw Failure(
            "The database '" + database.path() + "' was made by a newer tav.",
            "Install that one, or name another folder for the server.");
    }
}

/// Part of a `WriteTransaction` of the caller.
void upgrade(Database& database)
{
    std::int64_t const version = database.version();
    if (version < kFirstWithDelivered) { // An earlier tav handed out all that there was.
        database.run(kDelivered);
        database.run("INSERT INTO delivered SELECT repository, max(number) FROM commits GROUP BY repository");
    }
    if (version < kFirstWithContents) {
        ContentTables::create(database);
    }
    if (version < kTablesVersion) {
        database.setVersion(kTablesVersion);
    }
}

/// What a snapshot and a transaction have in common.
template <class Interface>
class Reading : public Interface {
public:
    Reading(Database& database, std::int64_t key)
        : database_(database)
        , key_(key)
        , tables_(database, key)
        , contents_(database, key)
    {
    }

    std::optional<CommitRecord> find(OdString const& hash) const override { return tables_.find(hash); }
    std::optional<CommitRecord> find(std::int64_t number) const override { return tables_.find(number); }
    std::vector<CommitRecord> after(std::int64_t number) const override { return tables_.after(number); }
    std::vector<CommitNumber> numbersFrom(std::int64_t first) const override { return tables_.numbersFrom(first); }
    std::int64_t lastNumber() const override { return tables_.lastNumber(); }
    bool isBefore(OdString const& ancestor, OdString const& hash) const override
    {
        return tables_.isBefore(ancestor, hash);
    }
    std::vector<CommitNumber> between(OdString const& from, OdString const& to) const override
    {
        return tables_.between(from, to);
    }
    Tree files(OdString const& hash) const override { return tables_.files(hash); }
    std::vector<FileRecord> changes(OdString const& hash) const override { return tables_.changes(hash); }
    std::vector<common::Reference> references() const override { return tables_.references(); }
    std::optional<common::Reference> reference(OdString const& name) const override { return tables_.reference(name); }

    std::int64_t delivered() const override
    {
        if (database_.version() < kFirstWithDelivered) {
            return lastNumber();
        }
        Statement row = database_.prepare("SELECT number FROM delivered WHERE repository = ?");
        return row.with(key_).next() ? row.integer(0) : 0;
    }

    std::optional<StoredContent> content(Digest const& digest) const override
    {
        return hasContents() ? contents_.content(digest) : std::nullopt;
    }
    std::optional<StoredContent> contentOfRecord(Digest const& record) const override
    {
        return hasContents() ? contents_.contentOfRecord(record) : std::nullopt;
    }
    std::vector<StoredContent> unneeded(std::int64_t now, std::size_t most) const override
    {
        return hasContents() ? contents_.unneeded(now, most) : std::vector<StoredContent>();
    }
    bool isAwaited(Digest const& digest) const override { return hasContents() && contents_.isAwaited(digest); }
    std::optional<Upload> upload(std::int64_t id) const override
    {
        return hasContents() ? contents_.upload(id) : std::nullopt;
    }
    std::optional<Upload> upload(OdString const& folder, Digest const& record) const override
    {
        return hasContents() ? contents_.upload(folder, record) : std::nullopt;
    }
    std::vector<Upload> uploadsBefore(std::int64_t time) const override
    {
        return hasContents() ? contents_.uploadsBefore(time) : std::vector<Upload>();
    }
    bool isUsed(std::int64_t id) const override { return hasContents() && contents_.isUsed(id); }

protected:
    CommitTables& tables() { return tables_; }
    ContentTables& contents() { return contents_; }

private:
    bool hasContents() const { return database_.version() >= kFirstWithContents; }

    Database& database_;
    std::int64_t key_;
    CommitTables tables_;
    ContentTables contents_;
};

class Snapshot final : public Reading<HistorySnapshot> {
public:
    Snapshot(Database& database, std::int64_t key) : Reading(database, key), transaction_(database) {}

private:
    ReadTransaction transaction_;
};

class Transaction final : public Reading<HistoryTransaction> {
public:
    Transaction(Database& database, std::int64_t key) : Reading(database, key), transaction_(database)
    {
        upgrade(database);
    }

    void add(CommitRecord const& commit, std::vector<FileRecord> const& changes) override
    {
        tables().addChanges(commit, changes);
    }
    void set(common::Reference const& reference) override { tables().set(reference); }
    void removeReference(OdString const& name) override { tables().removeReference(name); }

    void set(StoredContent const& content) override { contents().set(content); }
    void removeContent(Digest const& digest) override { contents().removeContent(digest); }
    void lease(std::vector<Digest> const& digests, std::int64_t time) override { contents().lease(digests, time); }
    std::vector<Digest> name(std::vector<Digest> const& digests) override { return contents().name(digests); }
    void await(std::vector<Digest> const& digests) override { contents().await(digests); }
    void removeAwaited(Digest const& digest) override { contents().removeAwaited(digest); }
    std::int64_t add(Upload const& upload) override { return contents().add(upload); }
    void touch(std::int64_t upload, std::int64_t now) override { contents().touch(upload, now); }
    void removeUpload(std::int64_t id) override { contents().removeUpload(id); }

    void commit() override { transaction_.commit(); }

private:
    WriteTransaction transaction_;
};

} // namespace

SqliteHistory::SqliteHistory(std::string const& path) : database_(path)
{
    prepareTables(database_);
}

std::vector<Repository> SqliteHistory::repositories()
{
    Statement rows = database_.prepare("SELECT id, name FROM repositories ORDER BY key");
    std::vector<Repository> repositories;
    while (rows.next()) {
        repositories.push_back({rows.text(0), rows.text(1)});
    }
    return repositories;
}

std::optional<Repository> SqliteHistory::find(OdString const& id)
{
    Statement row = database_.prepare("SELECT id, name FROM repositories WHERE id = ?");
    return row.with(id).next() ? std::optional(Repository{row.text(0), row.text(1)}) : std::nullopt;
}

bool SqliteHistory::add(Repository const& repository)
{
    WriteTransaction transaction(database_);
    if (find(repository.id)) {
        return false;
    }
    Statement row = database_.prepare("INSERT INTO repositories(id, name) VALUES (?, ?)");
    row.with(repository.id).with(repository.name).run();
    transaction.commit();
    return true;
}

std::unique_ptr<HistorySnapshot> SqliteHistory::read(OdString const& id)
{
    return std::make_unique<Snapshot>(database_, keyOf(id));
}

std::unique_ptr<HistoryTransaction> SqliteHistory::write(OdString const& id)
{
    return std::make_unique<Transaction>(database_, keyOf(id));
}

bool SqliteHistory::hasUpload(std::int64_t id)
{
    return database_.version() >= kFirstWithContents && ContentTables::hasUpload(database_, id);
}

// No commit is lost when it is not noted, so it is no reason to hand nothing out.
void SqliteHistory::noteDelivered(OdString const& id, std::int64_t number)
{
    std::int64_t const key = keyOf(id);
    if (Snapshot(database_, key).delivered() >= number) {
        return;
    }
    try {
        WriteTransaction transaction(database_);
        Statement row = database_.prepare("INSERT OR REPLACE INTO delivered VALUES (?, ?)");
        row.with(key).with(number).run();
        transaction.commit();
    } catch (Failure const&) {
    }
}

std::int64_t SqliteHistory::keyOf(OdString const& id) const
{
    Statement row = database_.prepare("SELECT key FROM repositories WHERE id = ?");
    if (!row.with(id).next()) {
        throw Failure("The server has no repository " + quoted(id) + ".", "Run 'tav server' to see where it is.");
    }
    return row.integer(0);
}

} // namespace tav
