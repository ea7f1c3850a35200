#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/repository/journal.h"
#include "host/repository/open.h"
#include "host/text/utf8.h"

#include "common/mu_common_history.h"

#include "platform/ut/text.h"

#include <map>
#include <string>

namespace tav {

namespace {

OdString titleOf(CommitRecord const& commit)
{
    std::string const message = commit.message.ansi_str();
    return fromUtf8(message.substr(0, message.find('\n')));
}

/// What the library shows of an entry, put together here: its texts are of Qt, which keeps no bytes that are not UTF-8.
std::string infoOf(CommitRecord const& commit)
{
    OdTimeStamp date;
    date.setPackedValue(commit.date);
    std::string const age = common::HistoryItem(date, {}, {}, {}, 0).getInfo().toStdString();
    OdArray<OdString> const author = ut::splitByChar(commit.author, L'@', false);
    return author.isEmpty() ? age : shown(author.first()) + " \u2981 " + age;
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

std::string linesOf(CommitRecord const& commit, Names const& names)
{
    std::string const number = std::to_string(commit.number);
    std::string const indent(number.size() + 2, ' ');
    return number + "  " + shown(titleOf(commit)) + namesAt(commit.hash, names) + "\n" + indent + infoOf(commit) + "\n";
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
    if (std::string const notice = pendingNotice(root, database); !notice.empty()) {
        printNote(notice);
    }
    std::vector<CommitRecord> commits = database.commits().history(
        options.start.empty() ? database.currentCommit() : findCommit(database, options.start).hash);
    if (options.count > 0 && commits.size() > options.count) {
        commits.resize(options.count);
    }
    if (options.json) {
        printDocument(commits);
        return;
    }
    Names const names = namesByHash(database);
    for (CommitRecord const& commit : commits) {
        print(linesOf(commit, names));
    }
    if (commits.empty()) {
        print("There is no commit yet.\n");
    }
}

} // namespace tav
