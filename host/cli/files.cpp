#include "host/changes/changes.h"
#include "host/changes/digest.h"
#include "host/cli/commands.h"
#include "host/cli/committed_files.h"
#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/terminal/progress.h"
#include "host/text/utf8.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

namespace {

struct Listed {
    OdString path;
    std::optional<Digest> digest;
};

/// Digests the files in order. One that cannot be read is reported and left without a digest.
std::vector<Listed> digestAll(common::RootPath const& root, std::vector<common::File> const& files)
{
    std::vector<Listed> list;
    Progress progress("files", files.size());
    for (common::File const& file : files) {
        list.push_back({file.path, fileDigest(root.pathTo(file.path))});
        progress.advance();
    }
    return list;
}

kutils::json::Value documentOf(std::vector<Listed> const& list, bool hash)
{
    kutils::json::Array array;
    for (Listed const& file : list) {
        kutils::json::Object object;
        object[L"path"] = jsonText(file.path);
        if (hash) {
            object[L"sha256"] = file.digest ? jsonText(fromUtf8(hexOf(*file.digest))) : kutils::json::Value();
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

void printLines(std::vector<Listed> const& list, bool hash)
{
    for (Listed const& file : list) {
        if (!hash) {
            print(shown(file.path) + "\n");
        } else if (file.digest) {
            print(digestLine(*file.digest, file.path));
        }
    }
}

void failForUnread(std::vector<Listed> const& list)
{
    std::size_t unread = 0;
    for (Listed const& file : list) {
        if (!file.digest) {
            ++unread;
            printError("'" + file.path.ansi_str() + "' cannot be read.", "Check your permissions for it.");
        }
    }
    if (unread > 0) {
        throw Failure(
            std::to_string(unread) + " of " + std::to_string(list.size()) + " files could not be read.",
            "Correct that and run the command again.");
    }
}

void listCommittedFiles(FilesOptions const& options, common::RootPath const& root)
{
    LocalDatabase database = LocalDatabase::open(root);
    CommitRecord const commit = findCommit(database, options.commit);
    if (options.isLong) {
        printLastChanges(database, commit, options.json);
    } else {
        printCommittedFiles(database, commit, options.hash, options.json);
    }
}

} // namespace

void listFiles(FilesOptions const& options)
{
    common::RootPath const root = openRepository(options.folder);
    if (options.isLong || !options.commit.empty()) {
        listCommittedFiles(options, root);
        return;
    }
    std::vector<common::File> const files = scan(root).files;
    std::vector<Listed> list;
    if (options.hash) {
        list = digestAll(root, files);
    } else {
        for (common::File const& file : files) {
            list.push_back({file.path, std::nullopt});
        }
    }
    if (options.json) {
        printJson(documentOf(list, options.hash));
    } else {
        printLines(list, options.hash);
    }
    if (options.hash) {
        failForUnread(list);
    }
}

} // namespace tav
