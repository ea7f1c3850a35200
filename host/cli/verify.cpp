#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/progress.h"
#include "host/repository/local_database.h"
#include "host/repository/open.h"
#include "host/storage/local_storage.h"
#include "host/text/wide.h"

#include "common/mu_common_file_storage.h"

#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

struct Damage {
    OdString url;
    OdString what;
    FileVersion file; ///< one of the files that have this content
    OdString store;   ///< path of the file that is damaged
};

std::vector<Damage>
damagesOf(common::RootPath const& root, CommitTables const& commits, std::vector<OdString> const& urls)
{
    std::vector<Damage> damages;
    LocalStorage storage;
    Progress progress("versions", urls.size());
    for (OdString const& url : urls) {
        if (auto const outcome = storage.verify(root, url); !outcome.hasValue()) {
            auto const store = common::getStoragePath(root, url);
            damages.push_back(
                {url, outcome.error().message, commits.firstFileAt(url),
                 store.hasValue() ? store.value() : OdString::kEmpty});
        }
        progress.advance();
    }
    return damages;
}

void printDocument(std::size_t count, std::vector<Damage> const& damages)
{
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
    document[L"versions"] = static_cast<std::uint64_t>(count);
    document[L"damaged"] = std::move(array);
    printJson(std::move(document));
}

} // namespace

void verifyAll(bool json)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (std::string const damage = database.damage(); !damage.empty()) {
        throw Failure(
            "The database '" + database.path() + "' is damaged: " + damage + ".",
            "Put a copy of it from a backup in its place.");
    }
    std::vector<OdString> const urls = database.commits().urls();
    std::vector<Damage> const damages = damagesOf(root, database.commits(), urls);
    if (json) {
        printDocument(urls.size(), damages);
    } else if (damages.empty()) {
        print("Read " + counted(urls.size(), "stored version") + "; nothing is damaged.\n");
    }
    if (!damages.empty()) {
        Failure failure(
            std::to_string(damages.size()) + " of " + counted(urls.size(), "stored version") + " cannot be read.",
            "Put copies of these files from a backup in their place:");
        for (Damage const& damage : damages) {
            failure.details.push_back(
                damage.store.ansi_str() + ", for '" + damage.file.path.ansi_str() + "' of commit " +
                std::to_string(damage.file.commit) + ": " + damage.what.ansi_str());
        }
        throw failure;
    }
}

} // namespace tav
