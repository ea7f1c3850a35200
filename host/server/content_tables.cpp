#include "host/server/content_tables.h"

#include <set>
#include <string>
#include <utility>

namespace tav {

namespace {

constexpr char const* kTables = R"(
CREATE TABLE contents (
    repository INTEGER NOT NULL,
    digest TEXT NOT NULL,
    id INTEGER NOT NULL,
    record TEXT NOT NULL,
    base TEXT NOT NULL,
    chain INTEGER NOT NULL,
    length INTEGER NOT NULL,
    record_length INTEGER NOT NULL,
    is_named INTEGER NOT NULL,
    is_damaged INTEGER NOT NULL,
    leased INTEGER NOT NULL,
    PRIMARY KEY (repository, digest)
) WITHOUT ROWID;
CREATE INDEX contents_by_base ON contents (repository, base);
CREATE INDEX contents_by_record ON contents (repository, record);
CREATE INDEX contents_by_id ON contents (repository, id);
CREATE INDEX contents_without_name ON contents (repository, leased) WHERE is_named = 0;
CREATE TABLE awaited (
    repository INTEGER NOT NULL,
    digest TEXT NOT NULL,
    PRIMARY KEY (repository, digest)
) WITHOUT ROWID;
CREATE TABLE uploads (
    id INTEGER PRIMARY KEY AUTOINCREMENT,
    repository INTEGER NOT NULL,
    folder TEXT NOT NULL,
    record TEXT NOT NULL,
    digest TEXT NOT NULL,
    base TEXT NOT NULL,
    record_length INTEGER NOT NULL,
    touched INTEGER NOT NULL,
    UNIQUE (repository, folder, record)
);
INSERT INTO awaited SELECT DISTINCT repository, substr(url, -64) FROM changes WHERE url <> '';
)";

std::string const kContents =
    "SELECT digest, id, record, base, chain, length, record_length, is_named, is_damaged, leased FROM contents "
    "WHERE repository = ? ";
std::string const kUploads =
    "SELECT id, folder, record, digest, base, record_length, touched FROM uploads WHERE repository = ? ";

/// A base that there is not is an empty text.
std::string textOf(Digest const& digest)
{
    return digest == Digest{} ? std::string() : hexOf(digest);
}

Digest digestIn(Statement const& row, int column)
{
    return digestFromHex(row.bytes(column)).value_or(Digest{});
}

std::uint64_t lengthIn(Statement const& row, int column)
{
    return static_cast<std::uint64_t>(row.integer(column));
}

StoredContent contentOf(Statement const& row)
{
    return {digestIn(row, 0), row.integer(1),   digestIn(row, 2),    digestIn(row, 3),    row.integer(4),
            lengthIn(row, 5), lengthIn(row, 6), row.integer(7) != 0, row.integer(8) != 0, row.integer(9)};
}

Upload uploadOf(Statement const& row)
{
    return {row.integer(0),   row.text(1),      digestIn(row, 2), digestIn(row, 3),
            digestIn(row, 4), lengthIn(row, 5), row.integer(6)};
}

template <class Item>
std::vector<Item> all(Statement rows, Item (*read)(Statement const&))
{
    std::vector<Item> items;
    while (rows.next()) {
        items.push_back(read(rows));
    }
    return items;
}

template <class Item>
std::optional<Item> first(Statement rows, Item (*read)(Statement const&))
{
    return rows.next() ? std::optional(read(rows)) : std::nullopt;
}

/// `row` with its next parameter.
Statement& with(Statement& row, Digest const& digest)
{
    return row.with(std::string_view(textOf(digest)));
}

} // namespace

void ContentTables::create(Database& database)
{
    database.run(kTables);
}

Statement ContentTables::prepare(std::string const& statement) const
{
    Statement prepared = database_->prepare(statement.c_str());
    prepared.with(repository_);
    return prepared;
}

std::optional<StoredContent> ContentTables::content(Digest const& digest) const
{
    Statement row = prepare(kContents + "AND digest = ?");
    with(row, digest);
    return first(std::move(row), contentOf);
}

std::optional<StoredContent> ContentTables::contentOfRecord(Digest const& record) const
{
    Statement row = prepare(kContents + "AND record = ?");
    with(row, record);
    return first(std::move(row), contentOf);
}

std::vector<StoredContent> ContentTables::unneeded(std::int64_t now, std::size_t most) const
{
    Statement rows = prepare(
        kContents + "AND is_named = 0 AND leased <= ? AND NOT EXISTS (SELECT 1 FROM contents AS other "
                    "WHERE other.repository = contents.repository AND other.base = contents.digest) LIMIT ?");
    rows.with(now).with(static_cast<std::int64_t>(most));
    return all(std::move(rows), contentOf);
}

bool ContentTables::isAwaited(Digest const& digest) const
{
    Statement row = prepare("SELECT 1 FROM awaited WHERE repository = ? AND digest = ?");
    return with(row, digest).next();
}

std::optional<Upload> ContentTables::upload(std::int64_t id) const
{
    Statement row = prepare(kUploads + "AND id = ?");
    row.with(id);
    return first(std::move(row), uploadOf);
}

std::optional<Upload> ContentTables::upload(OdString const& folder, Digest const& record) const
{
    Statement row = prepare(kUploads + "AND folder = ? AND record = ?");
    with(row.with(folder), record);
    return first(std::move(row), uploadOf);
}

std::vector<Upload> ContentTables::uploadsBefore(std::int64_t time) const
{
    Statement rows = prepare(kUploads + "AND touched < ?");
    rows.with(time);
    return all(std::move(rows), uploadOf);
}

bool ContentTables::isUsed(std::int64_t id) const
{
    Statement content = prepare("SELECT 1 FROM contents WHERE repository = ? AND id = ?");
    return upload(id) || content.with(id).next();
}

void ContentTables::set(StoredContent const& content)
{
    Statement row = prepare("INSERT OR REPLACE INTO contents VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
    with(row, content.digest).with(content.id);
    with(with(row, content.record), content.base).with(content.chain);
    row.with(static_cast<std::int64_t>(content.length)).with(static_cast<std::int64_t>(content.recordLength));
    row.with(std::int64_t{content.isNamed}).with(std::int64_t{content.isDamaged}).with(content.leased).run();
}

void ContentTables::removeContent(Digest const& digest)
{
    Statement row = prepare("DELETE FROM contents WHERE repository = ? AND digest = ?");
    with(row, digest).run();
}

void ContentTables::lease(std::vector<Digest> const& contents, std::int64_t time)
{
    Statement row = database_->prepare(
        "UPDATE contents SET leased = max(leased, ?) WHERE repository = ? AND digest = ? AND is_named = 0");
    for (Digest const& digest : contents) {
        with(row.with(time).with(repository_), digest).run();
    }
}

std::vector<Digest> ContentTables::name(std::vector<Digest> const& contents)
{
    Statement there = database_->prepare("SELECT is_named FROM contents WHERE repository = ? AND digest = ?");
    Statement row = database_->prepare("UPDATE contents SET is_named = 1 WHERE repository = ? AND digest = ?");
    std::vector<Digest> others;
    for (Digest const& digest : std::set<Digest>(contents.begin(), contents.end())) {
        bool const isThere = with(there.with(repository_), digest).next();
        bool const isNamed = isThere && there.integer(0) != 0;
        there.reset();
        if (!isThere) {
            others.push_back(digest);
        } else if (!isNamed) {
            with(row.with(repository_), digest).run();
        }
    }
    return others;
}

void ContentTables::await(std::vector<Digest> const& contents)
{
    Statement row = database_->prepare("INSERT OR IGNORE INTO awaited VALUES (?, ?)");
    for (Digest const& digest : contents) {
        with(row.with(repository_), digest).run();
    }
}

void ContentTables::removeAwaited(Digest const& digest)
{
    Statement row = prepare("DELETE FROM awaited WHERE repository = ? AND digest = ?");
    with(row, digest).run();
}

std::int64_t ContentTables::add(Upload const& upload)
{
    Statement row = prepare("INSERT INTO uploads(repository, folder, record, digest, base, record_length, touched) "
                            "VALUES (?, ?, ?, ?, ?, ?, ?)");
    with(with(with(row.with(upload.folder), upload.record), upload.digest), upload.base);
    row.with(static_cast<std::int64_t>(upload.recordLength)).with(upload.touched).run();
    Statement id = database_->prepare("SELECT last_insert_rowid()");
    return id.next() ? id.integer(0) : 0;
}

void ContentTables::touch(std::int64_t upload, std::int64_t now)
{
    Statement row = database_->prepare("UPDATE uploads SET touched = ? WHERE repository = ? AND id = ?");
    row.with(now).with(repository_).with(upload).run();
}

void ContentTables::removeUpload(std::int64_t id)
{
    Statement row = prepare("DELETE FROM uploads WHERE repository = ? AND id = ?");
    row.with(id).run();
}

bool ContentTables::hasUpload(Database const& database, std::int64_t id)
{
    Statement row = database.prepare("SELECT 1 FROM uploads WHERE id = ?");
    return row.with(id).next();
}

} // namespace tav
