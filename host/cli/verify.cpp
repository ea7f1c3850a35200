#include "host/changes/stored_copies.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/client/contents.h"
#include "host/client/history.h"
#include "host/errors/failure.h"
#include "host/repository/local_database.h"
#include "host/repository/lock.h"
#include "host/repository/open.h"
#include "host/storage/local_storage.h"
#include "host/terminal/progress.h"
#include "host/text/plural.h"

#include "common/mu_common_file_storage.h"

#include <map>
#include <optional>
#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace tav {

namespace {

struct Damage {
    OdString url;
    OdString what;
    FileVersion file; ///< one of the files that have this content
    OdString store;   ///< path of the file that is damaged
};

/// Of a content that only the log of operations or a stash names there is no commit.
FileVersion fileAt(OdString const& url, LocalDatabase const& database)
{
    FileVersion file = database.commits().firstFileAt(url);
    if (file.commit == 0) {
        file.path = database.operations().pathAt(url);
        file.path = file.path.isEmpty() && database.hasShelves() ? database.shelves().pathAt(url) : file.path;
    }
    return file;
}

std::string ownerOf(FileVersion const& file)
{
    return "for '" + file.path.ansi_str() + "' " +
           (file.commit == 0 ? "of the commands to undo or the stash" : "of commit " + std::to_string(file.commit));
}

std::vector<Damage>
damagesOf(common::RootPath const& root, LocalDatabase const& database, std::vector<OdString> const& urls)
{
    std::vector<Damage> damages;
    LocalStorage storage(root);
    Progress progress("versions", urls.size());
    for (OdString const& url : urls) {
        if (auto const outcome = storage.verify(url); !outcome.hasValue()) {
            auto const store = common::getStoragePath(root, url);
            damages.push_back(
                {url, outcome.error().message, fileAt(url, database),
                 store.hasValue() ? store.value() : OdString::kEmpty});
        }
        progress.advance();
    }
    return damages;
}

/// How the history that is known here differs from the server's; none when it does not, or the server is away.
std::optional<Failure> differenceFromServer(LocalDatabase const& database)
{
    // The server may have a commit already that is noted here.
    bool const isUnfinished = !std::holds_alternative<std::monostate>(database.pendingOperation());
    if (database.repositoryId().isEmpty() || isUnfinished) {
        return std::nullopt;
    }
    HistoryComparison comparison;
    try {
        Connection connection(database);
        comparison = compareHistory(database, connection);
    } catch (Failure const& failure) {
        printNote("The history could not be compared with the server's. " + failure.what);
    }
    if (comparison.unknownThere > 0) {
        return Failure(
            "The server lacks " + countedThatAre(comparison.unknownThere, "commit") + " known here.",
            "An older copy of it may have been put back: run 'tav server --send' to send them again.");
    }
    if (comparison.unknownHere > 0) {
        return Failure(
            "The server has " + countedThatAre(comparison.unknownHere, "commit") + " not known here.",
            "Run 'tav fetch' to get them.");
    }
    return std::nullopt;
}

/// Working files by the URL of the damaged content that they gave back.
using Repaired = std::map<OdString, OdString>;

std::vector<OdString> urlsOf(std::vector<Damage> const& damages)
{
    std::vector<OdString> urls;
    for (Damage const& damage : damages) {
        urls.push_back(damage.url);
    }
    return urls;
}

/// Only what is damaged asks for the lock: whoever may only read can still verify.
Repaired repair(common::RootPath const& root, LocalDatabase const& database, std::vector<Damage>& damages)
{
    try {
        os::FileLock const lock = lockRepository(root, "verify");
        LocalStorage storage(root);
        Repaired repaired = repairFromFolder(root, database, storage, urlsOf(damages));
        damages = damagesOf(root, database, urlsOf(damages)); // Others may have built on what was damaged.
        return repaired;
    } catch (Failure const& failure) {
        printNote("Nothing could be repaired from the working folder: " + failure.what);
        return {};
    }
}

void printDocument(Contents const& contents, std::vector<Damage> const& damages, Repaired const& repaired)
{
    kutils::json::Array entries;
    for (auto const& [url, path] : repaired) {
        kutils::json::Object object;
        object[L"url"] = jsonText(url);
        object[L"path"] = jsonText(path);
        entries.emplace_back(std::move(object));
    }
    kutils::json::Array array;
    for (Damage const& damage : damages) {
        kutils::json::Object object;
        object[L"url"] = jsonText(damage.url);
        object[L"problem"] = jsonText(damage.what);
        object[L"path"] = jsonText(damage.file.path);
        object[L"commit"] = damage.file.commit;
        object[L"file"] = jsonText(damage.store);
        array.emplace_back(std::move(object));
    }
    kutils::json::Object document;
    document[L"elsewhere"] = static_cast<std::uint64_t>(contents.elsewhere.size());
    document[L"versions"] = static_cast<std::uint64_t>(contents.here.size());
    document[L"damaged"] = std::move(array);
    document[L"repaired"] = std::move(entries);
    printJson(std::move(document));
}

void printRepaired(Repaired const& repaired)
{
    if (repaired.empty()) {
        return;
    }
    print("Repaired " + counted(repaired.size(), "stored version") + " from the working folder:\n");
    for (auto const& [url, path] : repaired) {
        print("        " + shown(path) + "\n");
    }
}

void printSummary(Contents const& contents, std::vector<Damage> const& damages)
{
    if (damages.empty()) {
        print("Read " + counted(contents.here.size(), "stored version") + "; nothing is damaged.\n");
    }
    if (!contents.elsewhere.empty()) {
        print(
            "Not here: " + counted(contents.elsewhere.size(), "version") +
            " of commits that were made in other folders.\n");
    }
}

[[noreturn]] void failForDamages(std::vector<Damage> const& damages, std::size_t count)
{
    Failure failure(
        std::to_string(damages.size()) + " of " + counted(count, "stored version") + " cannot be read.",
        "Put copies of these files from a backup in their place:");
    for (Damage const& damage : damages) {
        failure.details.push_back(
            damage.store.ansi_str() + ", " + ownerOf(damage.file) + ": " + damage.what.ansi_str());
    }
    throw failure;
}

} // namespace

void verifyAll(bool json)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    database.failIfDamaged();
    Contents const contents = contentsOf(root, database);
    std::vector<Damage> damages = damagesOf(root, database, contents.here);
    Repaired const repaired = damages.empty() ? Repaired() : repair(root, database, damages);
    if (json) {
        printDocument(contents, damages, repaired);
    } else {
        printRepaired(repaired);
        printSummary(contents, damages);
    }
    std::optional<Failure> difference = differenceFromServer(database);
    if (!damages.empty()) {
        if (difference) {
            printNote(difference->what + " " + difference->next);
        }
        failForDamages(damages, contents.here.size());
    }
    if (difference) {
        throw Failure(std::move(*difference));
    }
}

} // namespace tav
