#include "host/history/commit_tables.h"

#include "host/errors/failure.h"
#include "host/history/tree.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace tav {

namespace {

constexpr char const* kTables = R"(
CREATE TABLE commits (
    repository INTEGER NOT NULL,
    number INTEGER NOT NULL,
    hash TEXT NOT NULL,
    author TEXT NOT NULL,
    message TEXT NOT NULL,
    date INTEGER NOT NULL,
    PRIMARY KEY (repository, number),
    UNIQUE (repository, hash)
) WITHOUT ROWID;
CREATE TABLE parents (
    repository INTEGER NOT NULL,
    number INTEGER NOT NULL,
    position INTEGER NOT NULL,
    parent INTEGER NOT NULL,
    PRIMARY KEY (repository, number, position),
    FOREIGN KEY (repository, number) REFERENCES commits,
    FOREIGN KEY (repository, parent) REFERENCES commits
) WITHOUT ROWID;
CREATE TABLE changes (
    repository INTEGER NOT NULL,
    number INTEGER NOT NULL,
    path TEXT NOT NULL,
    url TEXT NOT NULL,
    previous_path TEXT NOT NULL,
    PRIMARY KEY (repository, number, path),
    FOREIGN KEY (repository, number) REFERENCES commits
) WITHOUT ROWID;
CREATE TABLE refs (
    repository INTEGER NOT NULL,
    name TEXT NOT NULL,
    type INTEGER NOT NULL,
    number INTEGER NOT NULL,
    PRIMARY KEY (repository, name),
    FOREIGN KEY (repository, number) REFERENCES commits
) WITHOUT ROWID;
)";

std::string const kChangeColumns = "SELECT number, path, url, previous_path FROM changes WHERE repository = ? ";

constexpr char const* kCommitColumns = "SELECT number, hash, author, message, date FROM commits ";

bool isBefore(ListedFile const& a, ListedFile const& b)
{
    return a.path < b.path;
}

/// What commits changed, one after the other. Two neighbours become one when they are of about the same size: joining
/// each commit with all before it would take quadratic time.
class Layers {
public:
    /// Takes the changes of the next commit. The database has its own order for paths that are no UTF-8.
    void add(FileList changes)
    {
        if (!std::is_sorted(changes.begin(), changes.end(), isBefore)) {
            std::sort(changes.begin(), changes.end(), isBefore);
        }
        layers_.push_back(std::move(changes));
        while (layers_.size() > 1 && layers_.rbegin()[1].size() < 2 * layers_.back().size()) {
            joinLastTwo();
        }
    }

    /// The files that are left in the end.
    FileList files() &&
    {
        while (layers_.size() > 1) {
            joinLastTwo();
        }
        FileList files = layers_.empty() ? FileList() : std::move(layers_.front());
        auto const isGone = [](ListedFile const& file) { return file.url.empty(); };
        files.erase(std::remove_if(files.begin(), files.end(), isGone), files.end());
        return files;
    }

private:
    void joinLastTwo()
    {
        FileList later = std::move(layers_.back());
        layers_.pop_back();
        FileList& earlier = layers_.back();
        FileList both;
        both.reserve(earlier.size() + later.size());
        // Of a path that both have, the first list's file is taken.
        std::set_union(
            std::move_iterator(later.begin()), std::move_iterator(later.end()), std::move_iterator(earlier.begin()),
            std::move_iterator(earlier.end()), std::back_inserter(both), isBefore);
        earlier = std::move(both);
    }

    std::vector<FileList> layers_;
};

common::Reference referenceOf(Statement const& row)
{
    return {row.text(0), row.text(2), row.integer(1) == 0 ? common::EType::branch : common::EType::tag};
}

} // namespace

CommitTables::CommitTables(Database& database, std::int64_t repository) : database_(&database), repository_(repository)
{
}

void CommitTables::create(Database& database)
{
    database.run(kTables);
}

void CommitTables::createIndex(Database& database)
{
    database.run("CREATE INDEX changes_by_path ON changes (repository, path, number)");
}

void CommitTables::add(CommitRecord const& commit, std::vector<FileRecord> const& files)
{
    addChanges(commit, changesBetween(commit.parents.empty() ? Tree() : this->files(commit.parents.front()), files));
}

void CommitTables::addChanges(CommitRecord const& commit, std::vector<FileRecord> const& changes)
{
    Statement addCommit = database_->prepare("INSERT INTO commits VALUES (?, ?, ?, ?, ?, ?)");
    addCommit.with(repository_).with(commit.number).with(commit.hash).with(commit.author).with(commit.message);
    addCommit.with(commit.date).run();
    Statement addParent = database_->prepare("INSERT INTO parents VALUES (?, ?, ?, ?)");
    std::int64_t position = 0;
    for (OdString const& parent : commit.parents) {
        addParent.with(repository_).with(commit.number).with(position++).with(numberOf(parent)).run();
    }
    Statement addChange = database_->prepare("INSERT INTO changes VALUES (?, ?, ?, ?, ?)");
    for (FileRecord const& change : changes) {
        addChange.with(repository_).with(commit.number).with(change.path).with(change.url).with(change.previousPath);
        addChange.run();
    }
}

void CommitTables::clear()
{
    for (char const* const table : {"refs", "changes", "parents", "commits"}) { // None names what has gone already.
        Statement remove = database_->prepare(("DELETE FROM " + std::string(table) + " WHERE repository = ?").c_str());
        remove.with(repository_).run();
    }
}

std::optional<CommitRecord> CommitTables::find(OdString const& hash) const
{
    Statement rows = database_->prepare((std::string(kCommitColumns) + "WHERE repository = ? AND hash = ?").c_str());
    rows.with(repository_).with(hash);
    std::vector<CommitRecord> found = readAll(std::move(rows));
    return found.empty() ? std::nullopt : std::optional(std::move(found.front()));
}

std::optional<CommitRecord> CommitTables::find(std::int64_t number) const
{
    Statement rows = database_->prepare((std::string(kCommitColumns) + "WHERE repository = ? AND number = ?").c_str());
    rows.with(repository_).with(number);
    std::vector<CommitRecord> found = readAll(std::move(rows));
    return found.empty() ? std::nullopt : std::optional(std::move(found.front()));
}

std::vector<CommitRecord> CommitTables::find(std::vector<std::int64_t> const& numbers) const
{
    ReadTransaction const transaction(*database_); // One lock for all of them.
    Statement row = database_->prepare((std::string(kCommitColumns) + "WHERE repository = ? AND number = ?").c_str());
    Statement parents = prepareParents();
    std::vector<CommitRecord> commits;
    for (std::int64_t const number : numbers) {
        row.with(repository_).with(number);
        while (row.next()) {
            commits.push_back(commitOf(row, parents));
        }
    }
    return commits;
}

std::vector<CommitRecord> CommitTables::withPrefix(OdString const& prefix) const
{
    Statement rows = database_->prepare(
        (std::string(kCommitColumns) + "WHERE repository = ? AND hash >= ? AND hash < ? ORDER BY number LIMIT 2")
            .c_str());
    rows.with(repository_).with(prefix).with(prefix + L"g"); // Behind all hexadecimal digits.
    return readAll(std::move(rows));
}

std::vector<CommitRecord> CommitTables::after(std::int64_t number) const
{
    Statement rows = database_->prepare(
        (std::string(kCommitColumns) + "WHERE repository = ? AND number > ? ORDER BY number").c_str());
    rows.with(repository_).with(number);
    return readAll(std::move(rows));
}

std::vector<CommitRecord> CommitTables::history(OdString const& hash) const
{
    Statement rows = database_->prepare((std::string(R"(
        WITH RECURSIVE past(n) AS (
            SELECT number FROM commits WHERE repository = ?1 AND hash = ?2
            UNION
            SELECT parent FROM parents JOIN past ON repository = ?1 AND number = n)
        )") + kCommitColumns + "JOIN past ON repository = ?1 AND number = n ORDER BY number DESC")
                                            .c_str());
    rows.with(repository_).with(hash);
    return readAll(std::move(rows));
}

bool CommitTables::isBefore(OdString const& ancestor, OdString const& hash) const
{
    // Parents have lower numbers: below the ancestor's there is nothing to look for.
    Statement row = database_->prepare(R"(
        WITH RECURSIVE
            goal(g) AS (SELECT number FROM commits WHERE repository = ?1 AND hash = ?3),
            past(n) AS (
                SELECT number FROM commits WHERE repository = ?1 AND hash = ?2
                UNION
                SELECT parent FROM parents JOIN past ON repository = ?1 AND number = n
                WHERE parent >= (SELECT g FROM goal))
        SELECT 1 FROM past WHERE n = (SELECT g FROM goal))");
    return row.with(repository_).with(hash).with(ancestor).next();
}

std::int64_t CommitTables::lastNumber() const
{
    Statement row = database_->prepare("SELECT max(number) FROM commits WHERE repository = ?");
    return row.with(repository_).next() ? row.integer(0) : 0;
}

std::int64_t CommitTables::lastWithoutGap() const
{
    Statement row = database_->prepare(R"(
        SELECT max(number) FROM (
            SELECT number, row_number() OVER (ORDER BY number) AS place FROM commits WHERE repository = ?)
        WHERE number = place)");
    return row.with(repository_).next() ? row.integer(0) : 0;
}

std::vector<CommitNumber> CommitTables::numbersFrom(std::int64_t first) const
{
    Statement rows =
        database_->prepare("SELECT number, hash FROM commits WHERE repository = ? AND number >= ? ORDER BY number");
    rows.with(repository_).with(first);
    std::vector<CommitNumber> numbers;
    while (rows.next()) {
        numbers.push_back({rows.integer(0), rows.text(1)});
    }
    return numbers;
}

std::vector<std::int64_t> CommitTables::line(OdString const& hash) const
{
    Statement rows = database_->prepare(R"(
        WITH RECURSIVE line(n) AS (
            SELECT number FROM commits WHERE repository = ?1 AND hash = ?2
            UNION ALL
            SELECT parent FROM parents JOIN line ON repository = ?1 AND number = n AND position = 0 AND parent < n)
        SELECT n FROM line ORDER BY n)");
    rows.with(repository_).with(hash);
    std::vector<std::int64_t> numbers;
    while (rows.next()) {
        numbers.push_back(rows.integer(0));
    }
    return numbers;
}

Tree CommitTables::files(OdString const& hash) const
{
    Tree tree;
    for (ListedFile& file : fileList(hash)) {
        tree.emplace_hint(tree.end(), std::move(file.path), fromUtf8(file.url));
    }
    return tree;
}

FileList CommitTables::fileList(OdString const& hash) const
{
    ReadTransaction const transaction(*database_);
    // Asked for commit by commit, the rows come in the order of the table; all at once, they would be sorted on disk.
    Statement rows =
        database_->prepare("SELECT path, url FROM changes WHERE repository = ? AND number = ? ORDER BY path");
    Layers layers;
    for (std::int64_t const number : line(hash)) {
        rows.with(repository_).with(number);
        FileList changes;
        while (rows.next()) {
            changes.push_back({rows.text(0), std::string(rows.bytes(1))});
        }
        layers.add(std::move(changes));
    }
    return std::move(layers).files();
}

std::vector<FileRecord> CommitTables::changes(OdString const& hash) const
{
    Statement rows = database_->prepare(R"(
        SELECT path, url, previous_path FROM changes JOIN commits USING (repository, number)
        WHERE repository = ? AND hash = ? ORDER BY path)");
    rows.with(repository_).with(hash);
    std::vector<FileRecord> changes;
    while (rows.next()) {
        changes.push_back({rows.text(0), rows.text(1), rows.text(2)});
    }
    return changes;
}

std::vector<OdString> CommitTables::urls() const
{
    Statement rows =
        database_->prepare("SELECT DISTINCT url FROM changes WHERE repository = ? AND url <> '' ORDER BY url");
    rows.with(repository_);
    std::vector<OdString> urls;
    while (rows.next()) {
        urls.push_back(rows.text(0));
    }
    return urls;
}

std::unordered_map<std::int64_t, std::vector<std::int64_t>> CommitTables::parents() const
{
    // A parent has a lower number. In a database from a stranger it may not, and a walk along a circle would never end.
    Statement rows = database_->prepare(
        "SELECT number, parent FROM parents WHERE repository = ? AND parent < number ORDER BY number, position");
    rows.with(repository_);
    std::unordered_map<std::int64_t, std::vector<std::int64_t>> parents;
    while (rows.next()) {
        parents[rows.integer(0)].push_back(rows.integer(1));
    }
    return parents;
}

bool CommitTables::hasPath(std::string const& path) const
{
    Statement file = database_->prepare("SELECT 1 FROM changes WHERE repository = ? AND path = ? LIMIT 1");
    Statement below =
        database_->prepare("SELECT 1 FROM changes WHERE repository = ? AND path > ? AND path < ? LIMIT 1");
    std::string const first = path + "/";
    std::string const end = path + "0"; // The character behind the slash.
    return file.with(repository_).with(std::string_view(path)).next() ||
           below.with(repository_).with(std::string_view(first)).with(std::string_view(end)).next();
}

std::vector<PathChange> CommitTables::changesOf(std::string const& path) const
{
    // Asked for `path = ?`, SQLite reads the whole table in its own order instead of the index: 150 ms for 400,000
    // changes.
    Statement rows = database_->prepare((kChangeColumns + "AND path >= ? AND path <= ? ORDER BY path, number").c_str());
    rows.with(repository_).with(std::string_view(path)).with(std::string_view(path));
    return readChanges(rows);
}

std::vector<PathChange> CommitTables::changesBelow(std::string const& folder) const
{
    if (folder.empty()) {
        Statement rows = database_->prepare((kChangeColumns + "ORDER BY path, number").c_str());
        rows.with(repository_);
        return readChanges(rows);
    }
    std::string end = folder; // The first text behind all that begin so.
    ++end.back();
    Statement rows = database_->prepare((kChangeColumns + "AND path >= ? AND path < ? ORDER BY path, number").c_str());
    rows.with(repository_).with(std::string_view(folder)).with(std::string_view(end));
    return readChanges(rows);
}

std::vector<PathChange> CommitTables::readChanges(Statement& rows) const
{
    std::vector<PathChange> changes;
    while (rows.next()) {
        auto const text = [&](int column) { return std::string(rows.bytes(column)); };
        changes.push_back({rows.integer(0), text(1), text(2), text(3)});
    }
    return changes;
}

std::optional<PathChange> CommitTables::renameFrom(std::int64_t commit, std::string const& path) const
{
    Statement rows = database_->prepare((kChangeColumns + "AND number = ? AND previous_path = ? LIMIT 1").c_str());
    rows.with(repository_).with(commit).with(std::string_view(path));
    std::vector<PathChange> found = readChanges(rows);
    return found.empty() ? std::nullopt : std::optional(std::move(found.front()));
}

FileVersion CommitTables::firstFileAt(OdString const& url) const
{
    Statement row =
        database_->prepare("SELECT path, number FROM changes WHERE repository = ? AND url = ? ORDER BY number, path");
    return row.with(repository_).with(url).next() ? FileVersion{row.text(0), row.integer(1)} : FileVersion();
}

std::vector<common::Reference> CommitTables::references() const
{
    Statement rows = database_->prepare(R"(
        SELECT name, type, hash FROM refs JOIN commits USING (repository, number)
        WHERE repository = ? ORDER BY name)");
    rows.with(repository_);
    std::vector<common::Reference> references;
    while (rows.next()) {
        references.push_back(referenceOf(rows));
    }
    return references;
}

std::optional<common::Reference> CommitTables::reference(OdString const& name) const
{
    Statement row = database_->prepare(R"(
        SELECT name, type, hash FROM refs JOIN commits USING (repository, number)
        WHERE repository = ? AND name = ?)");
    row.with(repository_).with(name);
    return row.next() ? std::optional(referenceOf(row)) : std::nullopt;
}

void CommitTables::set(common::Reference const& reference)
{
    Statement row = database_->prepare("INSERT OR REPLACE INTO refs VALUES (?, ?, ?, ?)");
    row.with(repository_).with(reference.name).with(static_cast<std::int64_t>(reference.type));
    row.with(numberOf(reference.commitHash)).run();
}

void CommitTables::removeReference(OdString const& name)
{
    Statement row = database_->prepare("DELETE FROM refs WHERE repository = ? AND name = ?");
    row.with(repository_).with(name).run();
}

std::vector<CommitNumber> CommitTables::between(OdString const& from, OdString const& to) const
{
    Statement rows = database_->prepare(R"(
        WITH RECURSIVE
            kept(n) AS (
                SELECT number FROM commits WHERE repository = ?1 AND hash = ?3
                UNION
                SELECT parent FROM parents JOIN kept ON repository = ?1 AND number = n),
            past(n) AS (
                SELECT number FROM commits WHERE repository = ?1 AND hash = ?2
                UNION
                SELECT parent FROM parents JOIN past ON repository = ?1 AND number = n)
        SELECT number, hash FROM commits JOIN past ON repository = ?1 AND number = n
        WHERE n NOT IN (SELECT n FROM kept) ORDER BY number)");
    rows.with(repository_).with(from).with(to);
    std::vector<CommitNumber> numbers;
    while (rows.next()) {
        numbers.push_back({rows.integer(0), rows.text(1)});
    }
    return numbers;
}

std::int64_t CommitTables::numberOf(OdString const& hash) const
{
    Statement row = database_->prepare("SELECT number FROM commits WHERE repository = ? AND hash = ?");
    if (!row.with(repository_).with(hash).next()) {
        throw Failure("There is no commit '" + hash.ansi_str() + "'.", "Run 'tav log' to see those that there are.");
    }
    return row.integer(0);
}

Statement CommitTables::prepareParents() const
{
    return database_->prepare(R"(
        SELECT hash FROM parents JOIN commits
        ON commits.repository = parents.repository AND commits.number = parents.parent
        WHERE parents.repository = ? AND parents.number = ? ORDER BY position)");
}

CommitRecord CommitTables::commitOf(Statement const& row, Statement& parents) const
{
    CommitRecord commit{row.integer(0), row.text(1), row.text(2), row.text(3), row.integer(4), {}};
    parents.with(repository_).with(commit.number);
    while (parents.next()) {
        commit.parents.push_back(parents.text(0));
    }
    return commit;
}

std::vector<CommitRecord> CommitTables::readAll(Statement rows) const
{
    Statement parents = prepareParents();
    std::vector<CommitRecord> commits;
    while (rows.next()) {
        commits.push_back(commitOf(rows, parents));
    }
    return commits;
}

} // namespace tav
