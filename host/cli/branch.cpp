#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/planned_update.h"
#include "host/commits/commit_names.h"
#include "host/commits/references.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include <string>

namespace tav {

namespace {

struct Kind {
    char const* name; ///< of the command, and of what it makes
    common::EType type;
};

constexpr Kind kBranch = {"branch", common::EType::branch};
constexpr Kind kTag = {"tag", common::EType::tag};

struct Listed {
    OdString name;
    CommitRecord commit;
    bool isCurrent;
};

std::vector<Listed> listOf(common::RootPath const& root, LocalDatabase const& database, common::EType type)
{
    OdString const current = readState(root)->read().head;
    std::vector<Listed> list;
    for (common::Reference const& reference : database.commits().references()) {
        auto commit = database.commits().find(reference.commitHash);
        if (reference.type == type && commit) {
            bool const isCurrent = type == common::EType::branch && reference.name == current;
            list.push_back({reference.name, std::move(*commit), isCurrent});
        }
    }
    return list;
}

void printDocument(std::vector<Listed> const& list, Kind const& kind)
{
    kutils::json::Array array;
    for (Listed const& item : list) {
        kutils::json::Object object;
        object[L"name"] = jsonText(item.name);
        object[L"commit"] = item.commit.number;
        object[L"hash"] = jsonText(item.commit.hash);
        if (kind.type == common::EType::branch) {
            object[L"current"] = item.isCurrent;
        }
        array.emplace_back(std::move(object));
    }
    printJson(std::move(array));
}

void list(ReferenceOptions const& options, Kind const& kind)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    std::vector<Listed> const items = listOf(root, database, kind.type);
    if (options.json) {
        printDocument(items, kind);
        return;
    }
    if (items.empty()) {
        print(std::string("There is no ") + kind.name + " yet.\n");
    }
    for (Listed const& item : items) {
        std::string const line = shown(item.name) + "  (commit " + std::to_string(item.commit.number) + ")";
        print(item.isCurrent ? coloured(Colour::green, "* " + line) + "\n" : "  " + line + "\n");
    }
}

void make(ReferenceOptions const& options, Kind const& kind)
{
    WriteSession session(openRepository(""), kind.name);
    CommitRecord const commit = findCommit(session.database(), options.commit);
    makeReference(session.database(), {fromUtf8(*options.name), commit.hash, kind.type});
    report(
        std::string("Made the ") + kind.name + " '" + shown(fromUtf8(*options.name)) + "' at commit " +
        std::to_string(commit.number) + ".\n");
}

/// The one to delete, if it may be.
common::Reference findRemovable(
    ReferenceOptions const& options, Kind const& kind, common::RootPath const& root, LocalDatabase const& database)
{
    common::Reference const reference = findReference(database, fromUtf8(*options.name), kind.type);
    if (kind.type == common::EType::branch && reference.name == readState(root)->read().head) {
        throw Failure(
            "You are on the branch '" + reference.name.ansi_str() + "'.",
            "Run 'tav switch' to go to another branch first.");
    }
    if (!options.force) {
        failIfOnlyWayToCommits(database, reference);
    }
    return reference;
}

std::string described(common::Reference const& reference, Kind const& kind, LocalDatabase const& database)
{
    auto const commit = database.commits().find(reference.commitHash);
    std::string const number = commit ? std::to_string(commit->number) : reference.commitHash.ansi_str();
    return std::string(kind.name) + " '" + shown(reference.name) + "', which was at commit " + number + ".\n";
}

void previewRemoval(ReferenceOptions const& options, Kind const& kind)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    notePending(root, database);
    print("Would delete the " + described(findRemovable(options, kind, root, database), kind, database));
}

void remove(ReferenceOptions const& options, Kind const& kind)
{
    if (options.dryRun) {
        previewRemoval(options, kind);
        return;
    }
    WriteSession session(openRepository(""), kind.name);
    common::Reference const reference = findRemovable(options, kind, session.root(), session.database());
    std::string const what = described(reference, kind, session.database());
    removeReference(session.database(), reference);
    report("Deleted the " + what);
}

void rename(ReferenceOptions const& options)
{
    WriteSession session(openRepository(""), "branch");
    common::RootPath const& root = session.root();
    OdString const head = readState(root)->read().head;
    bool const namesBoth = !options.commit.empty();
    OdString const from = namesBoth ? fromUtf8(*options.name) : head;
    OdString const to = fromUtf8(namesBoth ? options.commit : *options.name);
    renameBranch(session.database(), findReference(session.database(), from, common::EType::branch), to, [&] {
        if (from == head) {
            changeState(root, [&](common::Cache& cache) { cache.write().head = to; });
        }
    });
    report("Renamed the branch '" + shown(from) + "' to '" + shown(to) + "'.\n");
}

void run(ReferenceOptions const& options, Kind const& kind)
{
    if (options.isDeleted) {
        remove(options, kind);
    } else if (options.isRenamed) {
        rename(options);
    } else if (options.name) {
        make(options, kind);
    } else {
        list(options, kind);
    }
}

} // namespace

void branch(ReferenceOptions const& options)
{
    run(options, kBranch);
}

void tag(ReferenceOptions const& options)
{
    run(options, kTag);
}

} // namespace tav
