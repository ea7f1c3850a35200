#include "host/changes/changes.h"
#include "host/changes/staging.h"
#include "host/checkout/working_tree.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"

#include "platform/ut/FileName.h"

#include <iterator>
#include <set>
#include <string>
#include <vector>

namespace tav {

namespace {

Tree chosenFiles(
    RestoreOptions const& options, Tree const& files, CommitRecord const& commit, common::RootPath const& root)
{
    std::vector<common::StagedFile> all;
    for (auto const& [path, url] : files) {
        all.emplace_back(path, common::FileChange::added);
    }
    NameFinder const finder(all, root);
    Tree chosen;
    for (std::string const& name : options.names) {
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

std::string resultOf(std::size_t files, std::size_t written, std::int64_t commit)
{
    std::string const where = "as in commit " + std::to_string(commit);
    return written == 0 ? "Nothing to restore: already " + where + ".\n"
                        : counted(files, "file") + " " + where + ", " + std::to_string(written) + " written.\n";
}

} // namespace

void restoreFiles(RestoreOptions const& options)
{
    WriteSession session(openRepository(""), "restore", Recovery::attempted);
    common::RootPath const& root = session.root();
    CommitRecord const commit = findCommit(session.database(), options.commit);
    Tree const files = chosenFiles(options, session.database().commits().files(commit.hash), commit, root);
    Tree const base = session.database().commits().files(session.database().currentCommit());
    TreeUpdate update;
    update.writes = files;
    LocalStorage storage(root);
    checkUpdate(
        root, session.database(), storage, stagedContents(readState(root)->read(), root),
        options.force ? Discard::everything : Discard::copies, update);
    common::State after = readState(root)->read();
    LogEntry entry(session.database(), typedCommand("restore", options.names), after);
    enterFiles(files, base, {}, after);
    entry.operation().files = replacedFiles(update);
    Updated const updated = carryOut(root, storage, update, session.start(), [&] {
        entry.write(after);
        entry.keep(); // What is written from here on stays.
    });
    changeState(root, [&](common::Cache& cache) { enterFiles(files, base, updated.times, cache.write()); });
    keepVerified(updated.verified, session.database());
    report(resultOf(files.size(), update.writes.size(), commit.number));
}

} // namespace tav
