#include "host/changes/status.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/status_lines.h"
#include "host/cli/unreadable_folders.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"

#include <string>

namespace tav {

namespace {

kutils::json::Array documentOf(std::vector<OdString> const& paths)
{
    kutils::json::Array array;
    array.reserve(paths.size());
    for (OdString const& path : paths) {
        array.push_back(jsonText(path));
    }
    return array;
}

kutils::json::Array documentOf(std::vector<common::ConflictInfo> const& conflicts)
{
    kutils::json::Array array;
    for (common::ConflictInfo const& conflict : conflicts) {
        kutils::json::Object object;
        object[L"path"] = jsonText(conflict.path);
        object[L"theirs"] = jsonText(conflict.theirsPath);
        object[L"base"] = jsonText(conflict.basePath);
        array.emplace_back(std::move(object));
    }
    return array;
}

kutils::json::Array documentOf(Renames const& renames)
{
    kutils::json::Array array;
    for (auto const& [path, previous] : renames) {
        kutils::json::Object object;
        object[L"path"] = jsonText(path);
        object[L"previous"] = jsonText(previous);
        array.emplace_back(std::move(object));
    }
    return array;
}

kutils::json::Array documentOf(std::vector<StagedEntry> const& entries)
{
    kutils::json::Array array;
    array.reserve(entries.size());
    for (StagedEntry const& entry : entries) {
        kutils::json::Object object;
        object[L"path"] = jsonText(entry.path);
        object[L"change"] = jsonText(valueOrFail(common::toString(entry.change), "Correct '.tav/tav.state'."));
        object[L"missing"] = entry.isMissing;
        if (!entry.previousPath.isEmpty()) {
            object[L"previous"] = jsonText(entry.previousPath);
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

void printDocument(Status const& status, bool withIgnored)
{
    kutils::json::Object object;
    object[L"branch"] = jsonText(status.branch);
    object[L"commit"] = status.commit;
    object[L"at_end"] = status.isAtEnd;
    object[L"conflicts"] = documentOf(status.conflicts);
    object[L"staged"] = documentOf(status.staged);
    object[L"modified"] = documentOf(status.modified);
    object[L"untracked"] = documentOf(status.untracked);
    object[L"removed"] = documentOf(status.removed);
    object[L"renamed"] = documentOf(status.renamed);
    object[L"unreachable"] = documentOf(status.unreachable);
    object[L"unreadable"] = documentOf(status.unreadable);
    if (withIgnored) {
        object[L"ignored"] = documentOf(status.ignored);
    }
    printJson(std::move(object));
}

void printGroup(
    char const* title, char const* hint, char const* label, Colour colour, std::vector<OdString> const& paths)
{
    if (paths.empty()) {
        return;
    }
    print(std::string(title) + "\n");
    if (*hint) {
        print("  (" + std::string(hint) + ")\n");
    }
    for (OdString const& path : paths) {
        print("        " + coloured(colour, label + shown(path)) + "\n");
    }
    print("\n");
}

void printConflicts(std::vector<common::ConflictInfo> const& conflicts)
{
    std::vector<OdString> paths;
    for (common::ConflictInfo const& conflict : conflicts) {
        paths.push_back(conflict.path);
    }
    printGroup("Drawings in conflict:", "the other versions are in '.tav/conflict'", "", Colour::red, paths);
}

void printStaged(std::vector<StagedEntry> const& entries)
{
    if (entries.empty()) {
        return;
    }
    print("Staged for the next commit:\n  (use 'tav unstage NAME' to take a file out)\n");
    for (StagedEntry const& entry : entries) {
        print("        " + coloured(entry.isMissing ? Colour::red : Colour::green, lineOf(entry)) + "\n");
    }
    print("\n");
}

void printRenamed(Renames const& renames, bool isDoubtful)
{
    if (renames.empty()) {
        return;
    }
    print("Renamed:\n");
    print(
        isDoubtful ? "  (some may be copies of missing files; use 'tav commit --all-removed' to take these, or "
                     "'--without-removed' to keep the files in the repository)\n"
                   : "  (the next commit takes these without staging)\n");
    for (auto const& [path, previous] : renames) {
        print("        " + coloured(Colour::red, "renamed:  " + shown(previous) + " -> " + shown(path)) + "\n");
    }
    print("\n");
}

/// The working folder itself is the empty path.
std::vector<OdString> asFolders(std::vector<OdString> const& paths)
{
    std::vector<OdString> folders;
    for (OdString const& path : paths) {
        folders.push_back((path.isEmpty() ? OdString(L".") : path) + L"/");
    }
    return folders;
}

void printForPeople(Status const& status)
{
    print("On branch " + shown(status.branch) + "\n");
    if (!status.isAtEnd) {
        print(
            "At commit " + std::to_string(status.commit) + ", which is not the end of the branch (use 'tav switch " +
            shown(status.branch) + "' to go there)\n");
    }
    print("\n");
    printConflicts(status.conflicts);
    printStaged(status.staged);
    printGroup(
        "Modified, not staged:", "use 'tav add NAME' to stage a file", "modified: ", Colour::red, status.modified);
    printRenamed(status.renamed, status.isRenameDoubtful);
    printGroup(
        "Removed:",
        status.isRemovalDoubtful
            ? "use 'tav commit --all-removed' to remove these, or '--without-removed' to keep them in the repository"
            : "the next commit takes these without staging",
        "removed:  ", Colour::red, status.removed);
    printGroup(
        "Behind links to folders:", "tav does not enter these; the next commit keeps the files as they are", "",
        Colour::red, status.unreachable);
    printGroup(
        "Folders that cannot be read:", "their files are not known; the next commit keeps those that it has", "",
        Colour::red, asFolders(status.unreadable));
    printGroup("New, not staged:", "use 'tav add NAME' or 'tav add --all' to stage", "", Colour::red, status.untracked);
    printGroup("Ignored:", "see 'tav ignore' for the rules", "", Colour::none, status.ignored);
    if (status.isClean()) {
        print("Nothing has changed since the last commit.\n");
    }
}

void printShort(std::string const& letters, OdString const& path, OdString const& previous = OdString())
{
    print(letters + " " + (previous.isEmpty() ? "" : shown(previous) + " -> ") + shown(path) + "\n");
}

std::string stagedLetters(StagedEntry const& entry)
{
    char const change = !entry.previousPath.isEmpty()                  ? 'R'
                        : entry.change == common::FileChange::added    ? 'A'
                        : entry.change == common::FileChange::modified ? 'M'
                                                                       : 'D';
    return std::string(1, change) + (entry.isMissing ? 'D' : ' ');
}

/// Two letters and a path in a line, as git does: what is staged, and what is different from that in the folder.
void printShort(Status const& status)
{
    noteUnreadable(kChangesNotKnown, Folders(status.unreadable.begin(), status.unreadable.end()));
    for (StagedEntry const& entry : status.staged) {
        printShort(stagedLetters(entry), entry.path, entry.previousPath);
    }
    for (OdString const& path : status.modified) {
        printShort(" M", path);
    }
    for (OdString const& path : status.removed) {
        printShort(" D", path);
    }
    for (auto const& [path, previous] : status.renamed) {
        printShort(" R", path, previous);
    }
    for (OdString const& path : status.untracked) {
        printShort("??", path);
    }
    for (OdString const& path : status.ignored) {
        printShort("!!", path);
    }
}

} // namespace

void showStatus(StatusOptions const& options)
{
    Status const status = statusOf(openRepository(""), options.ignored);
    if (!status.unfinishedWork.empty()) {
        printNote(status.unfinishedWork);
    }
    if (options.json) {
        printDocument(status, options.ignored);
    } else if (options.isShort) {
        printShort(status);
    } else {
        printForPeople(status);
    }
}

} // namespace tav
