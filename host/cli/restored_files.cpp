#include "host/cli/restored_files.h"

#include "host/changes/changes.h"
#include "host/changes/staging.h"
#include "host/cli/planned_update.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/working_state.h"

#include "platform/ut/FileName.h"

#include <iterator>
#include <map>
#include <set>

namespace tav {

namespace {

Tree chosenFiles(
    std::vector<std::string> const& names, Tree const& files, CommitRecord const& commit, common::RootPath const& root)
{
    std::vector<common::StagedFile> all;
    for (auto const& [path, url] : files) {
        all.emplace_back(path, common::FileChange::added);
    }
    NameFinder const finder(all, root);
    Tree chosen;
    for (std::string const& name : names) {
        std::vector<common::StagedFile> const found = finder.find(name);
        if (found.empty()) {
            throw Failure(
                "No file of commit " + std::to_string(commit.number) + " matches '" + name + "'.",
                "Name another one with --from, or run 'tav log' to see the commits.");
        }
        for (common::StagedFile const& file : found) {
            chosen.emplace(file.path, files.at(file.path));
        }
    }
    return chosen;
}

/// The files whose present content is staged.
std::set<OdString> stagedContents(common::State const& state, common::RootPath const& root)
{
    std::set<OdString> paths;
    for (common::StagedFile const& file : state.stagedFiles) {
        if (file.change != common::FileChange::removed && ut::FileName::fileExists(root.pathTo(file.path))) {
            paths.insert(file.path);
        }
    }
    return paths;
}

/// Who brings a file back does not want to remove or rename it any more.
void unstageRemovals(Tree const& files, common::State& state)
{
    for (auto rename = state.renames.begin(); rename != state.renames.end();) {
        rename = files.count(rename->second) > 0 ? state.renames.erase(rename) : std::next(rename);
    }
    std::vector<common::StagedFile> removals;
    for (common::StagedFile const& file : state.stagedFiles) {
        if (file.change == common::FileChange::removed && files.count(file.path) > 0) {
            removals.push_back(file);
        }
    }
    unstage(removals, state);
}

/// Files that equal those of the last commit stop being changes.
void enterFiles(
    Tree const& files, Tree const& base, std::map<OdString, std::uint64_t> const& times, common::State& state)
{
    unstageRemovals(files, state);
    std::vector<common::StagedFile> unchanged;
    for (auto const& [path, url] : files) {
        auto const committed = base.find(path);
        auto const time = times.find(path);
        if (committed == base.end() || committed->second != url) {
            state.index.erase(path);
            continue;
        }
        if (time != times.end()) {
            state.index.insert_or_assign(path, common::IndexData{time->second, false});
        }
        unchanged.emplace_back(path, common::FileChange::modified);
    }
    unstage(unchanged, state);
}

/// What is written over what. A file that could not be read cannot be brought back.
std::vector<FileContents> replacedFiles(TreeUpdate const& update)
{
    std::vector<FileContents> files;
    for (auto const& [path, url] : update.writes) {
        auto const before = update.others.find(path);
        bool const isKnown = before != update.others.end();
        if (isKnown || !update.marks.at(path).isThere) {
            files.push_back({path, isKnown ? before->second : OdString(), url});
        }
    }
    return files;
}

} // namespace

RestoredFiles findRestoredFiles(
    std::string const& typed, std::vector<std::string> const& names, common::RootPath const& root,
    LocalDatabase const& database)
{
    CommitRecord const commit = findCommit(database, typed);
    return {commit, chosenFiles(names, database.commits().files(commit.hash), commit, root)};
}

std::size_t
writeRestored(RestoredFiles const& restored, Discard discard, OdString const& command, WriteSession& session)
{
    common::RootPath const& root = session.root();
    Tree const& files = restored.files;
    Tree const base = session.database().commits().files(session.database().currentCommit());
    TreeUpdate update;
    update.writes = files;
    LocalStorage storage(root);
    checkUpdate(root, session.database(), storage, stagedContents(readState(root)->read(), root), discard, update);
    common::State after = readState(root)->read();
    LogEntry entry(session.database(), command, after);
    enterFiles(files, base, {}, after);
    entry.operation().files = replacedFiles(update);
    Updated const updated = carryOut(
        root, storage, update, session.start(), [&] { entry.write(after); }, [&] { entry.keep(); });
    changeState(root, [&](common::Cache& cache) { enterFiles(files, base, updated.times, cache.write()); });
    keepVerified(updated.verified, session.database());
    return update.writes.size();
}

void previewRestored(
    RestoredFiles const& restored, Discard discard, common::RootPath const& root, LocalDatabase const& database)
{
    notePending(root, database);
    TreeUpdate update;
    update.writes = restored.files;
    LocalStorage storage(root);
    std::vector<OdString> const discarded =
        planUpdate(root, database, storage, stagedContents(readState(root)->read(), root), discard, update);
    printPlan(update, discarded);
}

} // namespace tav
