#include "host/repository/working_state.h"

#include "host/errors/save_report.h"

#include "platform/os/os_files.h"

namespace tav {

namespace {

constexpr char const* kHowToComplete = "Run 'tav init' if '.tav/tav.state' is missing; mend it if not.";
constexpr char const* kOldStateStands =
    "The old state still stands; check the free space and your rights, and try again.";

/// Saving may fail when the new state is in place already but not yet safe. What the command did elsewhere is undone
/// then, so the old state has to be back. Where even this fails the disk takes nothing at all.
void putBack(std::string const& stateFile, std::string const& content)
{
    [[maybe_unused]] std::error_code const ignored = os::replaceFile(stateFile, content);
}

} // namespace

void makeState(common::RootPath const& root)
{
    SaveReport report;
    common::Cache::create(root, report);
    report.failUnlessSaved(kOldStateStands);
}

std::shared_ptr<common::Cache const> readState(common::RootPath const& root)
{
    static SaveReport const nothingToSave; // Outlives the caches, which are only read.
    return valueOrFail(common::Cache::get(root, nothingToSave), kHowToComplete);
}

void changeState(common::RootPath const& root, std::function<void(common::Cache&)> const& change)
{
    std::string const stateFile = root.statePath().ansi_str();
    std::string before;
    std::error_code const unread = os::readFile(stateFile, before);
    SaveReport report;
    {
        auto const cache = valueOrFail(common::Cache::get(root, report), kHowToComplete);
        common::Transaction transaction(*cache);
        change(*cache);
        transaction.commit();
    }
    if (report.hasFailed() && !unread) {
        putBack(stateFile, before);
    }
    report.failUnlessSaved(kOldStateStands);
}

} // namespace tav
