#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/text/wide.h"

#include "common/mu_common_history.h"

#include <map>
#include <string>

namespace tav {

namespace {

common::HistoryItem itemOf(CommitRecord const& commit)
{
    OdTimeStamp date;
    date.setPackedValue(commit.date);
    std::string const message = commit.message.ansi_str();
    OdString const title = wide(message.substr(0, message.find('\n')));
    return {date, commit.author, title, commit.hash, static_cast<int>(commit.number)};
}

using Names = std::multimap<OdString, std::string>;

/// The branches and tags at each commit.
Names namesByHash(LocalDatabase const& database)
{
    Names names;
    for (common::Reference const& reference : database.commits().references()) {
        names.emplace(reference.commitHash, shown(reference.name));
    }
    return names;
}

std::string namesAt(OdString const& hash, Names const& names)
{
    std::string list;
    for (auto [name, end] = names.equal_range(hash); name != end; ++name) {
        list += (list.empty() ? "  (" : ", ") + name->second;
    }
    return list.empty() ? list : list + ")";
}

std::string linesOf(common::HistoryItem const& item, Names const& names)
{
    std::string const number = std::to_string(item.number);
    std::string const indent(number.size() + 2, ' ');
    std::string const info = item.getInfo().toStdString();
    return number + "  " + shown(wide(item.getName().toStdString())) + namesAt(item.detail, names) + "\n" + indent +
           shown(wide(info)) + "\n";
}

void printDocument(std::vector<CommitRecord> const& commits)
{
    kutils::json::Array array;
    for (CommitRecord const& commit : commits) {
        array.emplace_back(documentOf(commit));
    }
    printJson(std::move(array));
}

} // namespace

void showLog(LogOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (std::string const unfinished = noteOnUnfinished(root, database); !unfinished.empty()) {
        printNote(unfinished);
    }
    std::vector<CommitRecord> commits =
        database.commits().history(options.start.empty() ? database.base() : findCommit(database, options.start).hash);
    if (options.count > 0 && commits.size() > options.count) {
        commits.resize(options.count);
    }
    if (options.json) {
        printDocument(commits);
        return;
    }
    Names const names = namesByHash(database);
    for (CommitRecord const& commit : commits) {
        print(linesOf(itemOf(commit), names));
    }
    if (commits.empty()) {
        print("There is no commit yet.\n");
    }
}

} // namespace tav
