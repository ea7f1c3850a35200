#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/current_settings.h"
#include "host/cli/output.h"
#include "host/cli/pager.h"
#include "host/cli/small_pictures.h"
#include "host/errors/failure.h"
#include "host/history/ancestry.h"
#include "host/history/file_history.h"
#include "host/repository/journal.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/storage/storage_url.h"
#include "host/text/dates.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <ctime>
#include <limits>
#include <map>
#include <optional>
#include <string>

namespace tav {

namespace {

/// A commit, and what it did to the files that were named.
struct Entry {
    CommitRecord commit;
    std::vector<FileEvent> files;
};

using Names = std::multimap<OdString, OdString>;

/// The branches and tags at each commit.
Names namesByHash(LocalDatabase const& database)
{
    Names names;
    for (common::Reference const& reference : database.commits().references()) {
        names.emplace(reference.commitHash, reference.name);
    }
    return names;
}

std::vector<std::int64_t>
startsOf(LogOptions const& options, LocalDatabase const& database, std::vector<CommitRecord> const& named)
{
    CommitTables const& commits = database.commits();
    std::vector<CommitRecord> starts = named;
    if (starts.empty() || options.all) {
        if (auto current = commits.find(database.currentCommit())) {
            starts.push_back(std::move(*current));
        }
    }
    if (options.all) {
        for (common::Reference const& reference : commits.references()) {
            starts.push_back(*commits.find(reference.commitHash));
        }
    }
    std::vector<std::int64_t> numbers;
    for (CommitRecord const& start : starts) {
        numbers.push_back(start.number);
    }
    return numbers;
}

/// The one file of the newest commit that `name` matches the end of.
OdString
pathMatching(std::string const& name, CommitTables const& commits, std::int64_t start, common::RootPath const& root)
{
    std::vector<common::StagedFile> files;
    if (auto const commit = commits.find(start)) {
        for (ListedFile const& file : commits.fileList(commit->hash)) {
            files.emplace_back(file.path, common::FileChange::added);
        }
    }
    std::vector<common::StagedFile> const found = NameFinder(files, root).find(name);
    if (found.size() != 1) {
        throw Failure("No commit has a file '" + name + "'.", "Run 'tav files' to see the names.");
    }
    return found.front().path;
}

std::vector<OdString> pathsOf(
    std::vector<std::string> const& names, CommitTables const& commits, std::vector<std::int64_t> const& starts,
    common::RootPath const& root)
{
    std::vector<OdString> paths;
    for (std::string const& name : names) {
        OdString const path = pathInRepository(root, name);
        bool const isKnown = path.isEmpty() || commits.hasPath(path.ansi_str());
        paths.push_back(isKnown ? path : pathMatching(name, commits, starts.empty() ? 0 : starts.front(), root));
    }
    return paths;
}

std::vector<Entry> entriesOf(std::vector<FileHistoryEntry> history, CommitTables const& commits)
{
    std::vector<std::int64_t> numbers;
    for (FileHistoryEntry const& entry : history) {
        numbers.push_back(entry.commit);
    }
    std::vector<CommitRecord> records = commits.find(numbers);
    std::vector<Entry> entries;
    for (std::size_t i = 0; i < records.size(); ++i) {
        entries.push_back({std::move(records[i]), std::move(history[i].events)});
    }
    return entries;
}

std::vector<FileHistoryEntry> wholeHistory(CommitTables const& commits, std::vector<std::int64_t> const& starts)
{
    std::vector<FileHistoryEntry> history;
    for (std::int64_t const number : Ancestry(commits).past(starts)) {
        history.push_back({number, {}});
    }
    return history;
}

TimeSpan spanOf(std::string const& typed, char const* option)
{
    if (typed.empty()) {
        return {std::numeric_limits<std::int64_t>::min(), std::numeric_limits<std::int64_t>::max()};
    }
    if (auto const span = parseDate(typed, std::time(nullptr))) {
        return *span;
    }
    throw Failure(
        std::string(option) + " '" + typed + "' is not a date.",
        "Type one as '2024-03-05', 'yesterday' or '3 days ago'.");
}

/// Leaves out what the options do not ask for. Dates need not ascend, so each commit is looked at.
void filter(LogOptions const& options, std::vector<Entry>& entries)
{
    std::int64_t const since = spanOf(options.since, "--since").first;
    std::int64_t const until = spanOf(options.until, "--until").last;
    auto const isUnwanted = [&](Entry const& entry) {
        return entry.commit.date < since || entry.commit.date > until ||
               entry.commit.author.ansi_str().find(options.author) == std::string::npos;
    };
    entries.erase(std::remove_if(entries.begin(), entries.end(), isUnwanted), entries.end());
    if (options.count > 0 && entries.size() > options.count) {
        entries.resize(options.count);
    }
}

bool hasFilter(LogOptions const& options)
{
    return !options.since.empty() || !options.until.empty() || !options.author.empty();
}

std::vector<Entry> findEntries(LogOptions const& options, common::RootPath const& root, LocalDatabase const& database)
{
    CommitTables const& commits = database.commits();
    CommitsAndNames const arguments = split(options.arguments, database, 1);
    std::vector<std::int64_t> const starts = startsOf(options, database, arguments.commits);
    std::vector<FileHistoryEntry> history =
        arguments.names.empty() ? wholeHistory(commits, starts)
                                : fileHistory(commits, starts, pathsOf(arguments.names, commits, starts, root));
    if (!hasFilter(options) && options.count > 0 && history.size() > options.count) {
        history.resize(options.count); // The rest need not be read.
    }
    std::vector<Entry> entries = entriesOf(std::move(history), commits);
    filter(options, entries);
    return entries;
}

kutils::json::Object documentOf(FileEvent const& file, LocalDatabase const& database)
{
    kutils::json::Object object;
    object[L"path"] = jsonText(file.path);
    object[L"change"] = jsonText(valueOrFail(common::toString(file.change), ""));
    if (!file.previousPath.isEmpty()) {
        object[L"previous"] = jsonText(file.previousPath);
    }
    if (auto const bytes = database.sizeOf(file.url)) {
        object[L"size"] = *bytes;
    }
    if (auto const sha256 = digestOf(file.url)) {
        object[L"sha256"] = jsonText(fromUtf8(hexOf(*sha256)));
    }
    return object;
}

void printDocument(std::vector<Entry> const& entries, Names const& names, LocalDatabase const& database)
{
    kutils::json::Array array;
    for (Entry const& entry : entries) {
        kutils::json::Object object = documentOf(entry.commit);
        kutils::json::Array references;
        for (auto [name, end] = names.equal_range(entry.commit.hash); name != end; ++name) {
            references.push_back(jsonText(name->second));
        }
        object[L"refs"] = std::move(references);
        kutils::json::Array files;
        for (FileEvent const& file : entry.files) {
            files.emplace_back(documentOf(file, database));
        }
        if (!files.empty()) {
            object[L"files"] = std::move(files);
        }
        array.emplace_back(std::move(object));
    }
    printJson(std::move(array));
}

std::string namesAt(OdString const& hash, Names const& names)
{
    std::string list;
    for (auto [name, end] = names.equal_range(hash); name != end; ++name) {
        list += (list.empty() ? "  (" : ", ") + shown(name->second);
    }
    return list.empty() ? list : list + ")";
}

/// The number, and the first line of the message.
std::string titleLine(CommitRecord const& commit, Names const& names)
{
    std::string const message = commit.message.ansi_str();
    OdString const title = fromUtf8(message.substr(0, message.find('\n')));
    return std::to_string(commit.number) + "  " + shown(title) + namesAt(commit.hash, names) + "\n";
}

DateForm dateForm()
{
    std::string const form = currentSettings().value("log.date");
    return form == "relative" ? DateForm::relative : form == "absolute" ? DateForm::absolute : DateForm::both;
}

std::string
lines(Entry const& entry, Names const& names, std::int64_t now, DateForm form, SmallPictures const* pictures)
{
    std::string const indent(std::to_string(entry.commit.number).size() + 2, ' ');
    OdString const author = authorName(entry.commit);
    std::string text = titleLine(entry.commit, names) + indent;
    text += author.isEmpty() ? "" : shown(author) + " \u2981 ";
    text += shownDate(entry.commit.date, now, form) + "\n";
    for (FileEvent const& file : entry.files) {
        text += indent + changeLine(file.change, file.path, file.previousPath) + "\n";
        text += pictures ? pictures->textFor(file.url, file.path) : std::string();
    }
    return text;
}

bool haveFewDrawings(std::vector<Entry> const& entries)
{
    std::size_t count = 0;
    for (Entry const& entry : entries) {
        count += entry.files.size();
    }
    return count > 0 && count <= kMostSmallPictures;
}

void printForPeople(std::vector<Entry> const& entries, Names const& names, bool oneline, SmallPictures const* pictures)
{
    std::int64_t const now = std::time(nullptr);
    DateForm const form = dateForm();
    for (Entry const& entry : entries) {
        print(oneline ? titleLine(entry.commit, names) : lines(entry, names, now, form, pictures));
    }
}

} // namespace

void showLog(LogOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (std::string const notice = pendingNotice(root, database); !notice.empty()) {
        printNote(notice);
    }
    std::vector<Entry> const entries = findEntries(options, root, database);
    SmallPictures const pictures(root);
    bool const showsPictures = pictures.canBeShown() && !options.oneline && !options.json && haveFewDrawings(entries);
    std::optional<Pager> pager;
    if (!showsPictures) {
        pager.emplace();
    }
    if (options.json) {
        printDocument(entries, namesByHash(database), database);
        return;
    }
    printForPeople(entries, namesByHash(database), options.oneline, showsPictures ? &pictures : nullptr);
    if (database.commits().lastNumber() == 0) {
        print("There is no commit yet.\n");
    }
}

} // namespace tav
