#include "host/cli/committed_files.h"

#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/history/last_changes.h"
#include "host/storage/storage_url.h"
#include "host/text/dates.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace tav {

namespace {

using Commits = std::unordered_map<std::int64_t, CommitRecord>;

/// The commits that changed one of the files last.
Commits lastCommits(std::vector<LastChange> const& files, std::vector<CommitRecord> all)
{
    std::unordered_set<std::int64_t> numbers;
    for (LastChange const& file : files) {
        numbers.insert(file.commit);
    }
    Commits found;
    for (CommitRecord& commit : all) {
        std::int64_t const number = commit.number;
        if (numbers.count(number) > 0) {
            found.emplace(number, std::move(commit));
        }
    }
    if (found.size() != numbers.size()) {
        throw Failure("The database lacks commits that changed files.", "Run 'tav fetch' to get them.");
    }
    return found;
}

/// What is printed in front of the files of each commit, in columns.
std::unordered_map<std::int64_t, std::string> columnsOf(Commits const& commits)
{
    std::size_t numberWidth = 0;
    std::size_t authorWidth = 0;
    for (auto const& [number, commit] : commits) {
        numberWidth = std::max(numberWidth, std::to_string(number).size());
        authorWidth = std::max(authorWidth, authorName(commit).getLength());
    }
    std::unordered_map<std::int64_t, std::string> columns;
    for (auto const& [number, commit] : commits) {
        std::string const digits = std::to_string(number);
        OdString const author = authorName(commit);
        columns[number] = std::string(numberWidth - digits.size(), ' ') + digits + "  " + localDate(commit.date) +
                          "  " + shown(author) + std::string(authorWidth - author.getLength() + 2, ' ');
    }
    return columns;
}

/// Whether a terminal shows the bytes as they are, whatever character set it has.
bool isPlain(std::string const& path)
{
    return std::all_of(path.begin(), path.end(), [](char c) { return c >= ' ' && c <= '~'; });
}

void printWithCommits(std::vector<LastChange> const& files, Commits const& commits)
{
    constexpr std::size_t kPiece = std::size_t{1} << 16; // A call for each of 200,000 lines takes longer.
    auto const columns = columnsOf(commits);
    std::string text;
    for (LastChange const& file : files) {
        text.append(columns.at(file.commit));
        text.append(isPlain(file.path) ? file.path : shown(fromUtf8(file.path))).push_back('\n');
        if (text.size() >= kPiece) {
            print(text);
            text.clear();
        }
    }
    print(text);
}

kutils::json::Array documentOf(std::vector<LastChange> const& files, Commits const& commits)
{
    kutils::json::Array array;
    for (LastChange const& file : files) {
        CommitRecord const& commit = commits.at(file.commit);
        kutils::json::Object object;
        object[L"path"] = jsonText(fromUtf8(file.path));
        object[L"author"] = jsonText(commit.author);
        object[L"commit"] = file.commit;
        object[L"date"] = jsonText(fromUtf8(dateMember(commit.date)));
        object[L"hash"] = jsonText(commit.hash);
        array.emplace_back(std::move(object));
    }
    return array;
}

void printLines(FileList const& files, bool hash)
{
    for (ListedFile const& file : files) {
        auto const digest = digestOf(file.url);
        print(hash && digest ? digestLine(*digest, file.path) : shown(file.path) + "\n");
    }
}

kutils::json::Array documentOf(FileList const& files, bool hash)
{
    kutils::json::Array array;
    for (ListedFile const& file : files) {
        kutils::json::Object object;
        object[L"path"] = jsonText(file.path);
        auto const digest = digestOf(file.url);
        if (hash && digest) {
            object[L"sha256"] = jsonText(fromUtf8(hexOf(*digest)));
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

} // namespace

void printCommittedFiles(LocalDatabase const& database, CommitRecord const& commit, bool hash, bool json)
{
    FileList const files = database.commits().fileList(commit.hash);
    if (json) {
        printJson(documentOf(files, hash));
    } else {
        printLines(files, hash);
    }
}

void printLastChanges(LocalDatabase& database, CommitRecord const& commit, bool json)
{
    LastChanges changes(database.database());
    std::vector<LastChange> const files = changes.at(commit);
    Commits const commits = lastCommits(files, changes.commits());
    if (json) {
        printJson(documentOf(files, commits));
    } else {
        printWithCommits(files, commits);
    }
}

} // namespace tav
