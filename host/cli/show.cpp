#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/content_output.h"
#include "host/cli/output.h"
#include "host/cli/pager.h"
#include "host/cli/small_pictures.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/storage/storage_url.h"
#include "host/text/utf8.h"

#include <optional>
#include <sstream>
#include <string>

namespace tav {

namespace {

void addVersion(
    OdString const& url, LocalDatabase const& database, wchar_t const* size, wchar_t const* digest,
    kutils::json::Object& object)
{
    if (url.isEmpty()) {
        return;
    }
    if (auto const bytes = database.sizeOf(url)) {
        object[size] = *bytes;
    }
    if (auto const sha256 = digestOf(url)) {
        object[digest] = jsonText(fromUtf8(hexOf(*sha256)));
    }
}

kutils::json::Array documentOf(std::vector<CommittedChange> const& changes, LocalDatabase const& database)
{
    kutils::json::Array array;
    for (CommittedChange const& change : changes) {
        kutils::json::Object object;
        object[L"path"] = jsonText(change.path);
        object[L"change"] = jsonText(valueOrFail(common::toString(change.change), ""));
        if (!change.previousPath.isEmpty()) {
            object[L"previous"] = jsonText(change.previousPath);
        }
        addVersion(change.oldUrl, database, L"old_size", L"old_sha256", object);
        addVersion(change.url, database, L"size", L"sha256", object);
        array.emplace_back(std::move(object));
    }
    return array;
}

std::string namesOf(CommitRecord const& commit, LocalDatabase const& database)
{
    std::string names;
    for (common::Reference const& reference : database.commits().references()) {
        if (reference.commitHash == commit.hash) {
            names += (names.empty() ? " (" : ", ") + shown(reference.name);
        }
    }
    return names.empty() ? names : names + ")";
}

void printMessage(OdString const& message)
{
    std::istringstream lines(message.ansi_str());
    print("\n");
    for (std::string line; std::getline(lines, line);) {
        print("    " + shownLine(fromUtf8(line)) + "\n");
    }
    print("\n");
}

std::string sizesOf(CommittedChange const& change, LocalDatabase const& database)
{
    std::string const sizes = sizesText(database.sizeOf(change.oldUrl), database.sizeOf(change.url));
    return sizes.empty() ? sizes : " (" + sizes + ")";
}

void printForPeople(
    CommitRecord const& commit, std::vector<CommittedChange> const& changes, LocalDatabase const& database,
    SmallPictures const* pictures)
{
    print("Commit " + std::to_string(commit.number) + namesOf(commit, database) + "\n");
    print("Hash:   " + commit.hash.ansi_str() + "\n");
    print("Author: " + shown(commit.author) + "\n");
    print("Date:   " + dateText(commit.date) + "\n");
    printMessage(commit.message);
    for (CommittedChange const& change : changes) {
        print(
            "        " + changeLine(change.change, change.path, change.previousPath) + sizesOf(change, database) +
            "\n" + (pictures ? pictures->textFor(change.url, change.path) : std::string()));
    }
}

/// Whole names of branches and tags come first: they may hold a colon.
std::optional<FileOfCommit>
fileToShow(ShowOptions const& options, LocalDatabase const& database, common::RootPath const& root)
{
    bool const isCommit = options.json || findCommitIfAny(database, options.commit);
    auto file = isCommit ? std::nullopt : findFileOfCommit(options.commit, database, root);
    if (!isCommit && !file) {
        requireCommitOf(options.commit, database);
    }
    return file;
}

} // namespace

void showCommit(ShowOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (auto const file = fileToShow(options, database, root)) {
        Pager const pager;
        printContent(*file, root);
        return;
    }
    CommitRecord const commit = findCommit(database, options.commit);
    std::vector<CommittedChange> const changes = committedChanges(database.commits(), commit);
    SmallPictures const pictures(root);
    bool const showsPictures = pictures.canBeShown() && !options.json && changes.size() <= kMostSmallPictures;
    std::optional<Pager> pager;
    if (!showsPictures) {
        pager.emplace();
    }
    if (!options.json) {
        printForPeople(commit, changes, database, showsPictures ? &pictures : nullptr);
        return;
    }
    kutils::json::Object document = documentOf(commit);
    document[L"changes"] = documentOf(changes, database);
    printJson(std::move(document));
}

} // namespace tav
