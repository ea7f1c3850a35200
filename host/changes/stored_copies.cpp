#include "host/changes/stored_copies.h"

#include "host/changes/changes.h"
#include "host/changes/digest.h"
#include "host/errors/failure.h"
#include "host/text/characters.h"

#include <cstdint>
#include <filesystem>
#include <set>

namespace tav {

namespace {

/// What to look for in the working folder.
struct Wanted {
    std::multimap<Digest, OdString> urls; ///< by digest
    std::set<std::uintmax_t> sizes;
    bool isAnySize = false; ///< the length of one of them is not known
};

Wanted wantedOf(std::vector<OdString> const& urls, LocalDatabase const& database)
{
    Wanted wanted;
    for (OdString const& url : urls) {
        auto const digest = digestOf(url);
        auto const size = database.sizeOf(url);
        if (digest) {
            wanted.urls.emplace(*digest, url);
            wanted.isAnySize = wanted.isAnySize || !size;
            wanted.sizes.insert(size.value_or(0));
        }
    }
    return wanted;
}

bool isCandidate(OdString const& path, Wanted const& wanted, common::RootPath const& root)
{
    std::error_code error;
    auto const size = std::filesystem::file_size(root.pathTo(path).ansi_str(), error);
    return !error && (wanted.isAnySize || wanted.sizes.count(size) > 0);
}

} // namespace

bool requireStored(LocalStorage& storage, OdString const& path, OdString const& url)
{
    auto const repaired = storage.repair(url, path);
    if (!repaired.hasValue()) {
        throw Failure(
            "The stored version of " + quoted(path) +
                " can neither be read nor stored again: " + repaired.error().message.ansi_str(),
            "The file stays, since it may be the only copy; check the disk and the free space.");
    }
    return repaired.value();
}

std::map<OdString, OdString> repairFromFolder(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::vector<OdString> const& urls)
{
    std::map<OdString, OdString> repaired;
    Wanted wanted = wantedOf(urls, database);
    Scanned const scanned = scan(root);
    for (common::File const& file : scanned.files) {
        if (wanted.urls.empty()) {
            break;
        }
        auto const digest = isCandidate(file.path, wanted, root) ? fileDigest(root.pathTo(file.path)) : std::nullopt;
        if (!digest) {
            continue;
        }
        auto const [begin, end] = wanted.urls.equal_range(*digest);
        for (auto content = begin; content != end; ++content) {
            requireStored(storage, file.path, content->second);
            repaired.emplace(content->second, file.path);
        }
        wanted.urls.erase(begin, end);
    }
    return repaired;
}

} // namespace tav
