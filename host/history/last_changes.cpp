#include "host/history/last_changes.h"

#include "host/errors/failure.h"
#include "host/history/ancestry.h"

#include <algorithm>
#include <charconv>
#include <map>
#include <string_view>
#include <unordered_map>
#include <unordered_set>

namespace tav {

namespace {

/// A list is kept when so many files are on it or so many commits were read for it: below that it is made anew sooner
/// than it is written.
constexpr std::size_t kManyFiles = 10'000;
constexpr std::size_t kManyCommits = 1'000;

std::int64_t numberIn(std::string_view digits)
{
    std::int64_t number = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return number;
}

/// "path NUL number NUL" for each file: no path holds a NUL.
std::string packed(std::vector<LastChange> const& files)
{
    std::string text;
    for (LastChange const& file : files) {
        text.append(file.path).push_back('\0');
        text.append(std::to_string(file.commit)).push_back('\0');
    }
    return text;
}

std::vector<LastChange> unpacked(std::string_view text)
{
    std::vector<LastChange> files;
    files.reserve(static_cast<std::size_t>(std::count(text.begin(), text.end(), '\0')) / 2);
    while (!text.empty()) {
        std::size_t const path = std::min(text.find('\0'), text.size() - 1);
        std::size_t const end = std::min(text.find('\0', path + 1), text.size());
        files.push_back({std::string(text.substr(0, path)), numberIn(text.substr(path + 1, end - path - 1))});
        text.remove_prefix(std::min(end + 1, text.size()));
    }
    return files;
}

} // namespace

void LastChanges::create(Database& database)
{
    database.run("CREATE TABLE last_changes (number INTEGER PRIMARY KEY, files BLOB NOT NULL)");
}

std::vector<LastChange> LastChanges::at(CommitRecord const& commit)
{
    Ancestry const ancestry(commits_);
    Kept list = kept();
    std::vector<std::int64_t> line; // Behind the list that is kept, or all of it.
    std::int64_t number = commit.number;
    for (; number != 0 && number != list.commit; number = ancestry.firstParent(number)) {
        line.push_back(number);
    }
    bool const isBehind = number != 0;
    std::vector<LastChange> files = isBehind ? after(std::move(list), line) : readAll(line);
    if (line.size() >= kManyCommits || (list.commit == 0 && files.size() >= kManyFiles)) {
        keep(commit.number, files);
    }
    return files;
}

std::vector<CommitRecord> LastChanges::commits() const
{
    Statement rows = database_->prepare("SELECT number, hash, author, date FROM commits WHERE repository = ?");
    rows.with(kRepository);
    std::vector<CommitRecord> commits;
    while (rows.next()) {
        commits.push_back({rows.integer(0), rows.text(1), rows.text(2), OdString(), rows.integer(3), {}});
    }
    return commits;
}

LastChanges::Kept LastChanges::kept() const
{
    Statement table = database_->prepare("SELECT 1 FROM sqlite_master WHERE name = 'last_changes'");
    if (!table.next()) {
        return {};
    }
    Statement row = database_->prepare("SELECT number, files FROM last_changes");
    return row.next() ? Kept{row.integer(0), unpacked(row.bytes(1))} : Kept();
}

void LastChanges::keep(std::int64_t commit, std::vector<LastChange> const& files)
{
    try {
        WriteTransaction transaction(*database_);
        database_->run("DELETE FROM last_changes");
        Statement row = database_->prepare("INSERT INTO last_changes VALUES (?, ?)");
        std::string const text = packed(files);
        row.with(commit).with(std::string_view(text)).run();
        transaction.commit();
    } catch (Failure const&) {
        // Without it the list is made again next time.
    }
}

std::vector<LastChange> LastChanges::readAll(std::vector<std::int64_t> const& line) const
{
    std::unordered_set<std::int64_t> const numbers(line.begin(), line.end());
    // In the order of the table: the index of paths has no URLs, and to look up each of them took twice as long.
    Statement rows =
        database_->prepare("SELECT path, number, url = '' FROM changes WHERE repository = ? ORDER BY number, path");
    rows.with(kRepository);
    std::unordered_map<std::string, std::int64_t> last; // 0: the file has gone.
    while (rows.next()) {
        if (numbers.count(rows.integer(1)) > 0) {
            last[std::string(rows.bytes(0))] = rows.integer(2) == 0 ? rows.integer(1) : 0;
        }
    }
    std::vector<LastChange> files;
    for (auto const& [path, number] : last) {
        if (number != 0) {
            files.push_back({path, number});
        }
    }
    std::sort(files.begin(), files.end(), [](auto const& a, auto const& b) { return a.path < b.path; });
    return files;
}

std::vector<LastChange> LastChanges::after(Kept kept, std::vector<std::int64_t> const& later) const
{
    std::map<std::string, std::int64_t> changed; // 0: the file has gone.
    Statement rows = database_->prepare("SELECT path, url = '' FROM changes WHERE repository = ? AND number = ?");
    for (std::int64_t const number : later) { // The last one first.
        rows.with(kRepository).with(number);
        while (rows.next()) {
            changed.emplace(rows.bytes(0), rows.integer(1) == 0 ? number : 0);
        }
    }
    if (changed.empty()) {
        return std::move(kept.files);
    }
    std::vector<LastChange> files;
    auto const add = [&](std::string path, std::int64_t number) {
        if (number != 0) {
            files.push_back({std::move(path), number});
        }
    };
    auto change = changed.begin();
    for (LastChange& file : kept.files) {
        for (; change != changed.end() && change->first < file.path; ++change) {
            add(change->first, change->second);
        }
        bool const isChanged = change != changed.end() && change->first == file.path;
        add(std::move(file.path), isChanged ? change->second : file.commit);
        change = isChanged ? std::next(change) : change;
    }
    for (; change != changed.end(); ++change) {
        add(change->first, change->second);
    }
    return files;
}

} // namespace tav
