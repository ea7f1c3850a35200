#include "host/changes/changes.h"
#include "host/changes/staging.h"
#include "host/checkout/shelving.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/storage/storage_url.h"
#include "host/text/dates.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <cstdlib>
#include <ctime>
#include <string>
#include <vector>

namespace tav {

namespace {

using Names = std::vector<std::string>;

constexpr char const* kList = "Run 'tav stash list' to see what there is.";

std::int64_t numberOf(Shelf const& shelf, LocalDatabase const& database)
{
    auto const commit = database.commits().find(shelf.commit);
    return commit ? commit->number : 0;
}

/// The one of that number, by default the newest, with its details.
Shelf findShelf(LocalDatabase const& database, Names const& numbers)
{
    std::vector<Shelf> const shelves = database.hasShelves() ? database.shelves().all() : std::vector<Shelf>();
    if (shelves.empty()) {
        throw Failure("Nothing has been put aside.", "Use 'tav stash' to put unfinished work aside.");
    }
    auto const isWanted = [&](Shelf const& shelf) { return numbers.empty() || std::to_string(shelf.id) == numbers[0]; };
    auto const found = std::find_if(shelves.begin(), shelves.end(), isWanted);
    if (found == shelves.end() || numbers.size() > 1) {
        throw Failure("There is no stash '" + numbers.back() + "'.", kList);
    }
    Shelf shelf = *found;
    database.shelves().readDetails(shelf);
    return shelf;
}

/// Moving a file changes two paths, which stay together.
void addOtherNames(common::State const& state, std::set<OdString>& paths)
{
    for (auto const& [path, previous] : state.renames) {
        if (paths.count(path) > 0 || paths.count(previous) > 0) {
            paths.insert({path, previous});
        }
    }
}

std::set<OdString> chosenPaths(
    Names const& names, std::vector<UnfinishedFile> const& files, common::State const& state,
    common::RootPath const& root)
{
    std::set<OdString> all = claimedPaths(state);
    for (UnfinishedFile const& file : files) {
        all.insert(file.path);
    }
    std::vector<common::StagedFile> candidates;
    for (OdString const& path : all) {
        candidates.emplace_back(path, common::FileChange::modified);
    }
    NameFinder const finder(candidates, root);
    std::set<OdString> chosen;
    for (std::string const& name : names) {
        std::vector<common::StagedFile> const found = finder.find(name);
        if (found.empty()) {
            throw Failure("No changed file matches '" + name + "'.", "Run 'tav status' to see what has changed.");
        }
        for (common::StagedFile const& file : found) {
            chosen.insert(file.path);
        }
    }
    addOtherNames(state, chosen);
    return names.empty() ? all : chosen;
}

void requireCommit(LocalDatabase const& database)
{
    if (database.currentCommit().isEmpty()) {
        throw Failure("There is no commit yet that the files could go back to.", "Make one with 'tav commit'.");
    }
}

void push(Names const& names, StashOptions const& options)
{
    WriteSession session(openRepository(""), "stash");
    session.failIfBetweenCommits();
    requireCommit(session.database());
    common::RootPath const& root = session.root();
    std::vector<UnfinishedFile> files = unfinishedFiles(root, session.database());
    std::set<OdString> const paths = chosenPaths(names, files, readState(root)->read(), root);
    if (paths.empty()) {
        throw Failure("There is nothing to put aside.", "Nothing has changed since the last commit.");
    }
    auto const isOther = [&](UnfinishedFile const& file) { return paths.count(file.path) == 0; };
    files.erase(std::remove_if(files.begin(), files.end(), isOther), files.end());
    Shelf const shelf = putAside(
        root, session.database(), files, paths,
        {typedCommand("stash", names), fromUtf8(options.message), session.start()});
    report(
        "Put " + counted(files.size(), "file") + " aside as stash " + std::to_string(shelf.id) +
        ". 'tav stash pop' brings " + (files.size() == 1 ? "it" : "them") + " back.\n");
}

std::string lineOf(Shelf const& shelf, LocalDatabase const& database)
{
    std::string const message = shelf.message.isEmpty() ? "" : ": " + shownLine(shelf.message);
    return std::to_string(shelf.id) + "  " + shownDate(shelf.date, std::time(nullptr), DateForm::absolute) + "  on " +
           shown(shelf.branch) + ", commit " + std::to_string(numberOf(shelf, database)) + ", " +
           counted(shelf.fileCount, "file") + message + "\n";
}

kutils::json::Object documentOf(Shelf const& shelf, LocalDatabase const& database)
{
    kutils::json::Object document;
    document[L"branch"] = jsonText(shelf.branch);
    document[L"commit"] = numberOf(shelf, database);
    document[L"date"] = jsonText(fromUtf8(dateMember(shelf.date)));
    document[L"files"] = static_cast<std::uint64_t>(shelf.fileCount);
    document[L"id"] = shelf.id;
    document[L"message"] = jsonText(shelf.message);
    return document;
}

void list(StashOptions const& options)
{
    LocalDatabase const database = LocalDatabase::open(openRepository(""));
    std::vector<Shelf> const shelves = database.hasShelves() ? database.shelves().all() : std::vector<Shelf>();
    kutils::json::Array array;
    for (Shelf const& shelf : shelves) {
        if (options.json) {
            array.emplace_back(documentOf(shelf, database));
        } else {
            print(lineOf(shelf, database));
        }
    }
    if (options.json) {
        printJson(std::move(array));
    } else if (shelves.empty()) {
        print("Nothing has been put aside.\n");
    }
}

struct ShownFile {
    OdString path;
    common::FileChange change;
    OdString previous;
    OdString url;
};

/// A renamed file is one change.
std::vector<ShownFile> changesOf(Shelf const& shelf)
{
    std::set<OdString> const former = formerPaths(shelf.staging);
    std::vector<ShownFile> changes;
    for (ShelvedFile const& file : shelf.files) {
        if (file.content.isEmpty() && former.count(file.path) > 0) {
            continue;
        }
        auto const rename = shelf.staging.renames.find(file.path);
        common::FileChange const change = file.content.isEmpty() ? common::FileChange::removed
                                          : file.base.isEmpty()  ? common::FileChange::added
                                                                 : common::FileChange::modified;
        changes.push_back(
            {file.path, change, rename == shelf.staging.renames.end() ? OdString() : rename->second, file.content});
    }
    return changes;
}

kutils::json::Object documentOf(ShownFile const& file)
{
    kutils::json::Object document;
    document[L"change"] = jsonText(valueOrFail(common::toString(file.change), ""));
    document[L"path"] = jsonText(file.path);
    if (!file.previous.isEmpty()) {
        document[L"previous"] = jsonText(file.previous);
    }
    if (auto const digest = digestOf(file.url)) {
        document[L"sha256"] = jsonText(fromUtf8(hexOf(*digest)));
    }
    return document;
}

void show(Names const& numbers, StashOptions const& options)
{
    LocalDatabase const database = LocalDatabase::open(openRepository(""));
    Shelf const shelf = findShelf(database, numbers);
    kutils::json::Array array;
    std::string lines;
    for (ShownFile const& file : changesOf(shelf)) {
        array.emplace_back(documentOf(file));
        lines += "        " + changeLine(file.change, file.path, file.previous) + "\n";
    }
    if (options.json) {
        printJson(std::move(array));
    } else {
        print(lineOf(shelf, database) + lines);
    }
}

void bringBack(Names const& numbers, char const* command, Shelved afterwards)
{
    WriteSession session(openRepository(""), "stash");
    session.failIfBetweenCommits();
    Shelf const shelf = findShelf(session.database(), numbers);
    std::string const number = std::to_string(shelf.id);
    BroughtBack const files = bringBack(
        session.root(), session.database(), shelf, afterwards,
        {typedCommand(command, {number}), OdString(), session.start()});
    report(
        "Brought back stash " + number + ": " + counted(files.written, "file") + " written, " +
        std::to_string(files.removed) + " removed.\n");
}

void dropShelf(Names const& numbers)
{
    WriteSession session(openRepository(""), "stash");
    Shelf const shelf = findShelf(session.database(), numbers);
    std::string const number = std::to_string(shelf.id);
    drop(session.root(), session.database(), shelf, typedCommand("stash drop", {number}));
    report("Dropped stash " + number + "; 'tav undo' brings it back.\n");
}

} // namespace

void stash(StashOptions const& options)
{
    Names rest = options.words;
    std::string const action = rest.empty() ? "" : rest.front();
    bool const isAction = action == "push" || action == "list" || action == "show" || action == "pop" ||
                          action == "apply" || action == "drop";
    if (isAction) {
        rest.erase(rest.begin());
    }
    if (action == "list") {
        list(options);
    } else if (action == "show") {
        show(rest, options);
    } else if (action == "pop") {
        bringBack(rest, "stash pop", Shelved::goes);
    } else if (action == "apply") {
        bringBack(rest, "stash apply", Shelved::stays);
    } else if (action == "drop") {
        dropShelf(rest);
    } else {
        push(rest, options);
    }
}

} // namespace tav
