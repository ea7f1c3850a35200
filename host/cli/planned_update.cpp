#include "host/cli/planned_update.h"

#include "host/cli/output.h"
#include "host/repository/journal.h"

#include <set>
#include <string>

namespace tav {

namespace {

void printFiles(char const* label, Tree const& files, std::set<OdString> const& discarded)
{
    for (auto const& [path, url] : files) {
        print(label + shown(path) + (discarded.count(path) > 0 ? " (has uncommitted changes)" : "") + "\n");
    }
}

} // namespace

void notePending(common::RootPath const& root, LocalDatabase const& database)
{
    std::string const notice = pendingNotice(root, database);
    if (!notice.empty()) {
        printNote(notice);
    }
}

void printPlan(TreeUpdate const& update, std::vector<OdString> const& discarded)
{
    if (update.writes.empty() && update.removals.empty()) {
        print("No file would be changed.\n");
        return;
    }
    std::set<OdString> const unsaved(discarded.begin(), discarded.end());
    printFiles("Would write:  ", update.writes, unsaved);
    printFiles("Would remove: ", update.removals, unsaved);
}

} // namespace tav
