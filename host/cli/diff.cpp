#include "host/changes/committed_changes.h"
#include "host/changes/digest.h"
#include "host/changes/line_diff.h"
#include "host/changes/working_changes.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/cli/pager.h"
#include "host/cli/unreadable_folders.h"
#include "host/errors/failure.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/storage/local_storage.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_storage.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace tav {

namespace {

/// A content on one side of a difference.
struct Side {
    std::optional<std::uint64_t> size;
    std::optional<Digest> sha256;
};

struct Compared {
    CommittedChange change; ///< without a URL of a file that is there: it is the one of the working folder
    Side before;
    Side after;
};

/// No more than so many files are shown with their lines unless that is asked for, and so many lines of one.
constexpr std::size_t kFewFiles = 5;
constexpr std::ptrdiff_t kFewLines = 200;

bool isInFolder(CommittedChange const& change)
{
    return change.url.isEmpty() && change.change != common::FileChange::removed;
}

Side workingSide(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    auto const size = std::filesystem::file_size(root.pathTo(path).ansi_str(), error);
    return {error ? std::nullopt : std::optional<std::uint64_t>(size), fileDigest(root.pathTo(path))};
}

Side storedSide(OdString const& url, LocalDatabase const& database)
{
    return {database.sizeOf(url), digestOf(url)};
}

Compared compared(CommittedChange const& change, common::RootPath const& root, LocalDatabase const& database)
{
    return {
        change, storedSide(change.oldUrl, database),
        isInFolder(change) ? workingSide(change.path, root) : storedSide(change.url, database)};
}

/// "A..B" in front of all names is the same as "A B".
void splitDots(WordList& list, LocalDatabase const& database)
{
    bool const isInFront = list.words.size() > list.names.value_or(0);
    std::string const word = isInFront ? list.words.front() : std::string();
    std::size_t const dots = word.find("..");
    if (dots == std::string::npos || dots == 0 || dots + 2 == word.size()) {
        return;
    }
    std::string const from = word.substr(0, dots);
    std::string const to = word.substr(dots + 2);
    if (findCommitIfAny(database, from) && findCommitIfAny(database, to)) {
        list.words.front() = from;
        list.words.insert(list.words.begin() + 1, to);
    }
}

std::vector<CommittedChange>
differences(std::vector<CommitRecord> const& commits, common::RootPath const& root, LocalDatabase const& database)
{
    if (commits.size() == 2) {
        return changesBetween(database.commits(), commits[0], commits[1]);
    }
    OdString const base = commits.empty() ? database.currentCommit() : commits[0].hash;
    std::vector<CommittedChange> changes;
    WorkingChanges const found = workingChanges(root, database, base);
    noteUnreadable(kChangesNotKnown, found.unreadable);
    for (WorkingChange const& change : found.files) {
        changes.push_back({change.path, change.change, change.previousPath, OdString(), change.oldUrl});
    }
    return changes;
}

std::vector<CommittedChange>
chosen(std::vector<CommittedChange> changes, std::vector<std::string> const& names, common::RootPath const& root)
{
    if (names.empty()) {
        return changes;
    }
    std::vector<common::StagedFile> all;
    for (CommittedChange const& change : changes) {
        all.emplace_back(change.path, change.change);
    }
    NameFinder const finder(all, root);
    std::set<OdString> paths;
    for (std::string const& name : names) {
        std::vector<common::StagedFile> const files = finder.find(name);
        if (files.empty()) {
            throw Failure("No changed file matches '" + name + "'.", "Run 'tav status' to see what has changed.");
        }
        for (common::StagedFile const& file : files) {
            paths.insert(file.path);
        }
    }
    std::vector<CommittedChange> found;
    for (CommittedChange& change : changes) {
        if (paths.count(change.path) > 0) {
            found.push_back(std::move(change));
        }
    }
    return found;
}

void addSide(Side const& side, wchar_t const* size, wchar_t const* digest, kutils::json::Object& object)
{
    if (side.size) {
        object[size] = *side.size;
    }
    if (side.sha256) {
        object[digest] = jsonText(fromUtf8(hexOf(*side.sha256)));
    }
}

kutils::json::Object documentOf(Compared const& file)
{
    kutils::json::Object object;
    object[L"path"] = jsonText(file.change.path);
    object[L"change"] = jsonText(valueOrFail(common::toString(file.change.change), ""));
    if (!file.change.previousPath.isEmpty()) {
        object[L"previous"] = jsonText(file.change.previousPath);
    }
    addSide(file.before, L"old_size", L"old_sha256", object);
    addSide(file.after, L"size", L"sha256", object);
    return object;
}

bool mayBeText(Compared const& file)
{
    bool const areShort =
        file.before.size && file.after.size && *file.before.size <= kLongestText && *file.after.size <= kLongestText;
    return areShort && file.before.sha256 != file.after.sha256 &&
           common::fileToType(file.change.path) == common::StorageType::Object;
}

std::optional<std::string> storedText(OdString const& url, common::RootPath const& root)
{
    std::string text;
    auto const keep = [&](char const* bytes, std::size_t count) { return text.append(bytes, count), true; };
    return LocalStorage(root).read(url, keep).hasValue() ? std::optional(std::move(text)) : std::nullopt;
}

std::optional<std::string> newText(CommittedChange const& change, common::RootPath const& root)
{
    if (!isInFolder(change)) {
        return storedText(change.url, root);
    }
    std::string text;
    bool const isRead = !os::readFile(root.pathTo(change.path).ansi_str(), text);
    return isRead ? std::optional(std::move(text)) : std::nullopt;
}

std::optional<std::string> linesOf(Compared const& file, common::RootPath const& root)
{
    if (!mayBeText(file)) {
        return std::nullopt;
    }
    auto const before = storedText(file.change.oldUrl, root);
    auto const after = newText(file.change, root);
    return before && after ? lineDiff(*before, *after) : std::nullopt;
}

void printLines(std::string const& text)
{
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        Colour const colour = line[0] == '+' ? Colour::green : line[0] == '-' ? Colour::red : Colour::none;
        print("    " + coloured(colour, shownLine(fromUtf8(line))) + "\n");
    }
}

void printDetails(Compared const& file, common::RootPath const& root, bool isText)
{
    if (file.before.sha256 && file.before.sha256 != file.after.sha256) {
        print("    old  " + hexOf(*file.before.sha256) + "\n");
    }
    if (file.after.sha256 && file.before.sha256 != file.after.sha256) {
        print("    new  " + hexOf(*file.after.sha256) + "\n");
    }
    auto const lines = linesOf(file, root);
    auto const count = lines ? std::count(lines->begin(), lines->end(), '\n') : 0;
    if (count > kFewLines && !isText) {
        print("    " + std::to_string(count) + " lines; 'tav diff --text' shows them\n");
    } else if (lines) {
        printLines(*lines);
    }
}

void printTotal(std::vector<CommittedChange> const& changes)
{
    std::map<std::string, std::size_t> counts;
    for (CommittedChange const& change : changes) {
        ++counts[changeText(change.change, change.previousPath)];
    }
    std::string text;
    for (auto const& [kind, count] : counts) {
        text += (text.empty() ? ": " : ", ") + std::to_string(count) + " " + kind;
    }
    print(counted(changes.size(), "file") + text + "\n");
}

void printForPeople(
    std::vector<CommittedChange> const& changes, DiffOptions const& options, common::RootPath const& root,
    LocalDatabase const& database)
{
    bool const isDetailed = !options.stat && (options.text || changes.size() <= kFewFiles);
    for (CommittedChange const& change : changes) {
        Compared const file = compared(change, root, database);
        std::string const sizes = sizesText(file.before.size, file.after.size);
        std::string const line = changeLine(change.change, change.path, change.previousPath);
        print(line + (sizes.empty() ? "" : " (" + sizes + ")") + "\n");
        if (isDetailed) {
            printDetails(file, root, options.text);
        }
    }
    if (!isDetailed) {
        printTotal(changes);
    }
}

void printDocument(
    std::vector<CommittedChange> const& changes, common::RootPath const& root, LocalDatabase const& database)
{
    kutils::json::Array array;
    for (CommittedChange const& change : changes) {
        array.emplace_back(documentOf(compared(change, root, database)));
    }
    printJson(std::move(array));
}

} // namespace

void showDifferences(DiffOptions const& options)
{
    Pager const pager;
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    WordList words = options.arguments;
    splitDots(words, database);
    CommitsAndNames const arguments = split(words, database, 2);
    std::vector<CommittedChange> const changes =
        chosen(differences(arguments.commits, root, database), arguments.names, root);
    if (options.json) {
        printDocument(changes, root, database);
    } else {
        printForPeople(changes, options, root, database);
    }
}

} // namespace tav
