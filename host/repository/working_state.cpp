#include "host/repository/working_state.h"

#include "host/errors/save_report.h"

#include "platform/os/os_files.h"
#include "platform/ut/FileName.h"

#include <utility>

namespace tav {

namespace {

constexpr char const* kOldStateStands =
    "The old state is unchanged; check the free space and your rights, and try again.";

std::shared_ptr<common::Cache> load(common::RootPath const& root, common::IoInterface const& io)
{
    Expected<std::shared_ptr<common::Cache>> cache = common::Cache::get(root, io);
    bool const isDamaged = !cache.hasValue() && ut::FileName::fileExists(root.statePath());
    return valueOrFail(
        std::move(cache), isDamaged ? "'.tav/tav.state' is damaged: move it away and run 'tav init'; only staging and "
                                      "the current branch are lost."
                                    : "Run 'tav init' to make it.");
}

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
    return load(root, nothingToSave);
}

void changeState(common::RootPath const& root, std::function<void(common::Cache&)> const& change)
{
    std::string const stateFile = root.statePath().ansi_str();
    std::string before;
    std::error_code const unread = os::readFile(stateFile, before);
    SaveReport report;
    {
        auto const cache = load(root, report);
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
