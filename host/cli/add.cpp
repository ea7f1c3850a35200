#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"
#include "host/text/wide.h"

#include <algorithm>
#include <string>
#include <vector>

namespace tav {

namespace {

[[noreturn]] void
failForUnknown(std::string const& name, common::RepoChanges const& changes, common::RootPath const& root)
{
    OdString const path = pathInRepository(root, name);
    for (auto const& file : changes.removed) {
        if (file.committed.path == path) {
            throw Failure("'" + name + "' has been removed.", "The next commit takes that without staging.");
        }
    }
    auto const isPath = [&](common::VersionedFile const& file) { return file.path == path; };
    bool const isUnchanged = std::any_of(changes.unchanged.begin(), changes.unchanged.end(), isPath);
    if (isUnchanged || !findUnchanged(name, changes, root).isEmpty()) {
        throw Failure("'" + name + "' is as it was committed.", "There is nothing to stage of it.");
    }
    throw Failure("No changed file matches '" + name + "'.", "Run 'tav status --ignored' to see what there is.");
}

std::vector<common::StagedFile>
chosenFiles(AddOptions const& options, common::RepoChanges const& changes, common::RootPath const& root)
{
    NameFinder const finder(changes, root);
    std::vector<common::StagedFile> chosen;
    if (options.all) {
        return finder.all();
    }
    for (std::string const& name : options.names) {
        std::vector<common::StagedFile> const found = finder.find(name);
        if (found.empty()) {
            failForUnknown(name, changes, root);
        }
        chosen.insert(chosen.end(), found.begin(), found.end());
    }
    return chosen;
}

} // namespace

void addFilesToStage(AddOptions const& options)
{
    Work const work(openRepository(""), "add", Work::Unfinished::mayStay);
    common::RootPath const& root = work.root();
    std::size_t count = 0;
    changeState(root, [&](common::Cache& cache) {
        VerifiedTimes verified;
        common::RepoChanges const changes =
            compare(root, matchFolder(root, lastCommitFiles(root)), cache.read(), &verified);
        enterVerified(verified, work.start(), cache.write());
        count = stage(chosenFiles(options, changes, root), cache.write());
    });
    print(count == 0 ? "Nothing new to stage.\n" : "Staged " + counted(count, "file") + ".\n");
}

} // namespace tav
