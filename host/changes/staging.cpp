#include "host/changes/staging.h"

#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/text/characters.h"

#include <algorithm>
#include <cwctype>
#include <map>
#include <utility>

namespace tav {

namespace {

/// Documents hold a character that is not printable by its low 16 bits only.
bool isStorable(OdString const& path)
{
    for (std::size_t i = 0; i < path.getLength(); ++i) {
        wchar_t const c = path.getAt(i);
        if (c > 0xFFFF && !std::iswprint(static_cast<std::wint_t>(c))) {
            return false;
        }
    }
    return true;
}

std::optional<std::string> whyNotStorable(OdString const& path)
{
    return isStorable(path) ? std::nullopt
                            : std::optional("The path " + quoted(path) + " holds a character that cannot be recorded.");
}

void requireKept(std::vector<common::StagedFile> const& files)
{
    Failure failure(
        "No commit can keep these names.",
        "Nothing has been staged; rename the files, or leave them out with 'tav ignore':");
    for (common::StagedFile const& file : files) {
        auto fault = file.change == common::FileChange::removed ? whyNotStorable(file.path) : whyNotKept(file.path);
        if (fault) {
            failure.details.push_back(std::move(*fault));
        }
    }
    if (!failure.details.empty()) {
        throw failure;
    }
}

using Paths = std::set<OdString>;

std::size_t dropStaged(Paths const& paths, common::State& state)
{
    auto& staged = state.stagedFiles;
    std::size_t const before = staged.size();
    auto const isListed = [&](common::StagedFile const& file) { return paths.count(file.path) > 0; };
    staged.erase(std::remove_if(staged.begin(), staged.end(), isListed), staged.end());
    return before - staged.size();
}

/// The path that a file had before its first move.
OdString takeFirstPath(OdString const& path, common::State& state)
{
    auto const rename = state.renames.find(path);
    if (rename == state.renames.end()) {
        return path;
    }
    OdString const first = rename->second;
    state.renames.erase(rename);
    return first;
}

} // namespace

std::optional<std::string> whyNotKept(OdString const& path)
{
    if (auto fault = whyUnsafe(path)) {
        return fault;
    }
    return whyNotStorable(path);
}

std::size_t stage(std::vector<common::StagedFile> const& files, common::State& state)
{
    requireKept(files);
    std::map<OdString, std::size_t> positions;
    for (std::size_t i = 0; i < state.stagedFiles.size(); ++i) {
        positions.emplace(state.stagedFiles[i].path, i);
    }
    std::size_t count = 0;
    for (common::StagedFile const& file : files) {
        auto const [position, isNew] = positions.emplace(file.path, state.stagedFiles.size());
        if (isNew) {
            state.stagedFiles.push_back(file);
            ++count;
        } else {
            state.stagedFiles[position->second].change = file.change;
        }
    }
    return count;
}

std::set<OdString> stagedPaths(common::State const& state)
{
    Paths paths;
    for (common::StagedFile const& file : state.stagedFiles) {
        paths.insert(file.path);
    }
    return paths;
}

std::set<OdString> formerPaths(common::State const& state)
{
    Paths paths;
    for (auto const& [path, previous] : state.renames) {
        paths.insert(previous);
    }
    return paths;
}

std::set<OdString> claimedPaths(common::State const& state)
{
    Paths paths = stagedPaths(state);
    paths.merge(formerPaths(state));
    return paths;
}

std::size_t unstage(std::vector<common::StagedFile> const& files, common::State& state)
{
    Paths paths;
    for (common::StagedFile const& file : files) {
        paths.insert(file.path);
        state.renames.erase(file.path);
    }
    return dropStaged(paths, state);
}

void enterRecords(IndexUpdates const& files, common::State& state)
{
    for (auto const& [path, record] : files) {
        if (record) {
            state.index.insert_or_assign(path, *record);
        } else {
            state.index.erase(path);
        }
    }
}

void applyIndexUpdates(IndexUpdates const& files, common::State& state, std::set<OdString> const& left)
{
    enterRecords(files, state);
    std::vector<common::StagedFile> committed;
    for (auto const& [path, record] : files) {
        if (left.count(path) == 0) {
            committed.emplace_back(path, common::FileChange::modified);
        }
    }
    unstage(committed, state);
    for (common::StagedFile& file : state.stagedFiles) {
        auto const update = files.find(file.path);
        if (update == files.end()) {
            continue;
        }
        state.renames.erase(file.path);
        if (file.change != common::FileChange::removed) {
            file.change = update->second ? common::FileChange::modified : common::FileChange::added;
        }
    }
}

void stageMoves(std::vector<Move> const& moves, common::State& state)
{
    Paths left;
    std::vector<common::StagedFile> moved;
    for (Move const& move : moves) {
        left.insert(move.from);
        OdString const first = takeFirstPath(move.from, state);
        if (first == move.to) {
            left.insert(move.to);
            continue;
        }
        moved.emplace_back(move.to, common::FileChange::added);
        if (isStorable(first)) { // No commit holds a file of any other name: it is new, not renamed.
            state.renames[move.to] = first;
        }
    }
    dropStaged(left, state);
    stage(moved, state);
}

} // namespace tav
