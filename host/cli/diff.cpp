#include "host/changes/digest.h"
#include "host/changes/line_diff.h"
#include "host/changes/working_changes.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/storage/local_storage.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_storage.h"

#include "platform/os/os_files.h"

#include <filesystem>
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
    WorkingChange change;
    Side before;
    Side after;
};

Side workingSide(WorkingChange const& change, common::RootPath const& root)
{
    if (change.change == common::FileChange::removed) {
        return {};
    }
    std::error_code error;
    auto const size = std::filesystem::file_size(root.pathTo(change.path).ansi_str(), error);
    return {error ? std::nullopt : std::optional<std::uint64_t>(size), fileDigest(root.pathTo(change.path))};
}

Compared compared(WorkingChange const& change, common::RootPath const& root, LocalDatabase const& database)
{
    return {change, {database.sizeOf(change.oldUrl), digestOf(change.oldUrl)}, workingSide(change, root)};
}

std::vector<WorkingChange>
chosen(std::vector<WorkingChange> changes, std::vector<std::string> const& names, common::RootPath const& root)
{
    if (names.empty()) {
        return changes;
    }
    std::vector<common::StagedFile> all;
    for (WorkingChange const& change : changes) {
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
    std::vector<WorkingChange> found;
    for (WorkingChange& change : changes) {
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

std::optional<std::string> linesOf(Compared const& file, common::RootPath const& root)
{
    if (!mayBeText(file)) {
        return std::nullopt;
    }
    std::string before;
    std::string after;
    LocalStorage storage(root);
    auto const keep = [&](char const* bytes, std::size_t count) { return before.append(bytes, count), true; };
    bool const isRead = storage.read(file.change.oldUrl, keep).hasValue() &&
                        !os::readFile(root.pathTo(file.change.path).ansi_str(), after);
    return isRead ? lineDiff(before, after) : std::nullopt;
}

void printLines(std::string const& text)
{
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        Colour const colour = line[0] == '+' ? Colour::green : line[0] == '-' ? Colour::red : Colour::none;
        print("    " + coloured(colour, shownLine(fromUtf8(line))) + "\n");
    }
}

void printForPeople(Compared const& file, common::RootPath const& root)
{
    std::string const sizes = sizesText(file.before.size, file.after.size);
    print(
        changeLine(file.change.change, file.change.path, file.change.previousPath) +
        (sizes.empty() ? "" : " (" + sizes + ")") + "\n");
    if (file.before.sha256 && file.before.sha256 != file.after.sha256) {
        print("    old  " + hexOf(*file.before.sha256) + "\n");
    }
    if (file.after.sha256 && file.before.sha256 != file.after.sha256) {
        print("    new  " + hexOf(*file.after.sha256) + "\n");
    }
    if (auto const lines = linesOf(file, root)) {
        printLines(*lines);
    }
}

} // namespace

void showDifferences(DiffOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    kutils::json::Array array;
    for (WorkingChange const& change : chosen(workingChanges(root, database), options.names, root)) {
        Compared const file = compared(change, root, database);
        if (options.json) {
            array.emplace_back(documentOf(file));
        } else {
            printForPeople(file, root);
        }
    }
    if (options.json) {
        printJson(std::move(array));
    }
}

} // namespace tav
