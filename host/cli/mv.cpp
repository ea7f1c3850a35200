#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/checkout/file_moves.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/planned_update.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"

#include <algorithm>
#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

bool isInTav(OdString const& path)
{
    return (path + L"/").left(5) == OdString(L".tav/");
}

bool isBelow(OdString const& path, OdString const& folder)
{
    return path.left(folder.getLength() + 1) == folder + L"/";
}

/// The files of a folder that cannot be read would count as removed in their old place.
void failIfUnreadable(OdString const& from, Folders const& unreadable)
{
    for (OdString const& folder : unreadable) {
        if (folder == from || isBelow(folder, from)) {
            throw Failure(
                "The folder '" + folder.ansi_str() + "' cannot be read, so its files would not be renamed.",
                "Check your permissions for it.");
        }
    }
}

/// Into a folder that exists, a file keeps its name.
OdString targetOf(OdString const& from, std::string const& typed, common::RootPath const& root)
{
    OdString const to = pathInRepository(root, typed);
    OdString const full = to.isEmpty() ? root.path() : root.pathTo(to);
    if (!ut::Dir::exists(full)) {
        if (typed.back() == '/' && !ut::Dir::exists(root.pathTo(from))) {
            throw Failure("There is no folder '" + typed + "'.", "Make it first.");
        }
        return to;
    }
    std::string const name = std::filesystem::path(from.ansi_str()).filename().string();
    return to.isEmpty() ? fromUtf8(name) : to + L"/" + fromUtf8(name);
}

/// A scan does not follow links to folders, so what lies behind one would be lost to the repository.
void checkFolders(OdString const& to, common::RootPath const& root)
{
    std::filesystem::path folder = root.path().ansi_str();
    for (auto const& part : std::filesystem::path(to.ansi_str()).parent_path()) {
        folder /= part;
        if (std::filesystem::is_symlink(std::filesystem::symlink_status(folder))) {
            throw Failure(
                "The repository would not keep '" + to.ansi_str() + "': '" + folder.string() + "' is a link.",
                "Choose another folder.");
        }
    }
}

template <class Predicate>
void failIfAnyPart(OdString const& to, Predicate const& isLeftOut)
{
    std::filesystem::path const path = to.ansi_str();
    if (std::any_of(path.begin(), path.end(), isLeftOut)) {
        throw Failure(
            "The repository would not keep '" + to.ansi_str() + "': its name is hidden or ignored.",
            "Choose another name, or see 'tav ignore'.");
    }
}

/// Rules come last: they are slow on names that are too long for any file.
void checkTarget(OdString const& to, common::RootPath const& root)
{
    failIfAnyPart(to, [](std::filesystem::path const& part) { return part.string().front() == '.'; });
    if (auto const fault = whyNotKept(to)) {
        throw Failure(*fault, "Choose another name.");
    }
    common::RepoIgnore const rules(root);
    failIfAnyPart(to, [&](std::filesystem::path const& part) { return rules.matches(fromUtf8(part.string())); });
}

/// The files that move when `from` becomes `to`: itself, or all that lie in it.
std::vector<Move> movesOf(OdString const& from, OdString const& to, std::vector<common::File> const& files)
{
    std::vector<Move> moves;
    OdString const prefix = from + L"/";
    for (common::File const& file : files) {
        if (file.path == from) {
            moves.push_back({from, to});
        } else if (file.path.left(prefix.getLength()) == prefix) {
            moves.push_back({file.path, to + L"/" + file.path.mid(prefix.getLength())});
        }
    }
    return moves;
}

/// The committed file `path`; null when there is none.
ListedFile const* find(FileList const& committed, OdString const& path)
{
    auto const isBefore = [](ListedFile const& file, OdString const& other) { return file.path < other; };
    auto const file = std::lower_bound(committed.begin(), committed.end(), path, isBefore);
    return file != committed.end() && file->path == path ? &*file : nullptr;
}

/// A file that comes to a committed path and is no committed file itself has been renamed away from there by hand, or
/// is to take its place. Either way it is that file again, and not a renamed one; so is noted where it began.
void noteReturns(std::vector<Move> const& moves, FileList const& committed, common::State& state)
{
    for (Move const& move : moves) {
        auto const rename = state.renames.find(move.from);
        OdString const& first = rename == state.renames.end() ? move.from : rename->second;
        if (!find(committed, first) && find(committed, move.to)) {
            state.renames[move.from] = move.to;
        }
    }
}

/// A file that is back, or has been replaced, is no longer the former name of one that is gone.
void dropRenamesTo(std::vector<Move> const& moves, common::RootPath const& root, common::State& state)
{
    std::set<OdString> back;
    for (Move const& move : moves) {
        back.insert(move.to);
    }
    std::vector<common::StagedFile> stale;
    for (auto const& [path, previous] : state.renames) {
        if (back.count(previous) > 0 && !ut::FileName::fileExists(root.pathTo(path))) {
            stale.emplace_back(path, common::FileChange::added);
        }
    }
    unstage(stale, state);
}

/// The files that are back where the last commit has them, with another content than it has. Where they come from the
/// next commit would have taken that content; so it does here.
std::vector<common::StagedFile> changedAndBack(
    std::vector<Move> const& moves, FileList const& committed, common::State const& state, common::RootPath const& root)
{
    std::vector<common::StagedFile> changed;
    for (Move const& move : moves) {
        auto const rename = state.renames.find(move.from);
        bool const isBack = rename != state.renames.end() && rename->second == move.to;
        ListedFile const* const file = find(committed, move.to);
        if (isBack && file && hasOtherContent(move.to, fromUtf8(file->url), root)) {
            changed.emplace_back(move.to, common::FileChange::modified);
        }
    }
    return changed;
}

/// What a command is to move, after everything that can be checked before.
struct Planned {
    OdString from;
    OdString to;
    std::vector<Move> moves;
};

Planned plan(MvOptions const& options, common::RootPath const& root)
{
    OdString const from = pathInRepository(root, options.from);
    OdString const to = targetOf(from, options.to, root);
    Scanned const scanned = scan(root);
    std::vector<Move> moves = movesOf(from, to, scanned.files);
    if (moves.empty()) {
        throw Failure(
            "'" + options.from + "' is not a file or folder of the repository.", "Run 'tav files' to see those.");
    }
    if (isBelow(to, from)) {
        throw Failure("'" + options.from + "' cannot be moved into itself.", "Choose another place.");
    }
    failIfUnreadable(from, scanned.unreadable);
    if (isInTav(from)) {
        throw Failure("'" + options.from + "' belongs to the repository itself.", "It cannot be moved.");
    }
    checkTarget(to, root);
    checkFolders(to, root);
    return {from, to, std::move(moves)};
}

void preview(MvOptions const& options)
{
    common::RootPath const root = openRepository("");
    notePending(root, LocalDatabase::open(root));
    Planned const planned = plan(options, root);
    FileMoves(root.path().ansi_str()).requireFree(planned.to.ansi_str());
    print("Would rename '" + shown(planned.from) + "' to '" + shown(planned.to) + "'.\n");
}

} // namespace

void moveFiles(MvOptions const& options)
{
    if (options.dryRun) {
        preview(options);
        return;
    }
    WriteSession session(openRepository(""), "mv", Recovery::attempted);
    common::RootPath const& root = session.root();
    Planned const planned = plan(options, root);
    OdString const& from = planned.from;
    OdString const& to = planned.to;
    std::vector<Move> const& moves = planned.moves;
    std::optional<LogEntry> entry; // Goes last: after a failure the file is back by then.
    FileMoves onDisk(root.path().ansi_str());
    changeState(root, [&](common::Cache& cache) {
        entry.emplace(session.database(), typedCommand("mv", {options.from, options.to}), cache.read());
        entry->operation().kind = Kind::rename;
        entry->operation().movedFrom = from;
        entry->operation().movedTo = to;
        entry->write(cache.read());
        onDisk.move(from.ansi_str(), to.ansi_str());
        common::State& state = cache.write();
        FileList const committed = lastCommitFiles(root);
        noteReturns(moves, committed, state);
        std::vector<common::StagedFile> const changed = changedAndBack(moves, committed, state, root);
        stageMoves(moves, state);
        dropRenamesTo(moves, root, state);
        stage(changed, state);
        entry->write(state);
    });
    onDisk.keep();
    entry->keep();
    report("Renamed '" + shown(from) + "' to '" + shown(to) + "'.\n");
}

} // namespace tav
