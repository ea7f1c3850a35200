#include "host/storage/cleaning.h"

#include "host/storage/files.h"
#include "host/storage/inventory.h"
#include "host/storage/object_bases.h"
#include "host/storage/reduced_store.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <algorithm>
#include <iterator>
#include <sys/stat.h>
#include <vector>

namespace tav {

namespace {

/// Removes a file that holds `contents` contents.
Freed removeFile(std::string const& path, std::size_t contents)
{
    struct statx status;
    check(os::examine(path, status), "'" + path + "' cannot be examined");
    check(os::removeUnflushed(path), "'" + path + "' cannot be removed");
    return {contents, status.stx_size};
}

Freed removeAllIn(std::string const& folder)
{
    Freed freed;
    for (std::string const& name : entriesOf(folder)) {
        freed += removeFile(std::string(folder).append("/").append(name), 0);
    }
    return freed;
}

/// What nobody needs among the objects, given that what a needed one builds on is needed too.
std::vector<Digest> unneededObjects(StorageLayout const& layout, std::set<Digest> const& needed)
{
    std::set<Digest> const objects = objectsIn(layout);
    std::vector<Digest> unneeded;
    std::set_difference(objects.begin(), objects.end(), needed.begin(), needed.end(), std::back_inserter(unneeded));
    if (unneeded.empty()) {
        return unneeded; // The headers need not be read.
    }
    ObjectBases const bases(layout);
    std::set<Digest> kept;
    std::set_intersection(
        objects.begin(), objects.end(), needed.begin(), needed.end(), std::inserter(kept, kept.end()));
    if (auto const unknown = bases.firstUnknown(kept)) {
        throw StorageError("The object " + quoted(StorageUrl{{}, *unknown}.text()) + " is damaged.");
    }
    std::set<Digest> basesOfKept;
    for (Digest const& digest : kept) {
        std::vector<Digest> const chain = bases.chainOf(digest);
        basesOfKept.insert(chain.begin(), chain.end());
    }
    unneeded.erase(
        std::remove_if(
            unneeded.begin(), unneeded.end(), [&](Digest const& digest) { return basesOfKept.count(digest) > 0; }),
        unneeded.end());
    return unneeded;
}

/// Returns why the objects stay, if they do: what builds on what is not known then.
std::optional<StorageError> cleanObjects(StorageLayout const& layout, std::set<Digest> const& needed, Freed& freed)
{
    std::vector<Digest> unneeded;
    try {
        unneeded = unneededObjects(layout, needed);
    } catch (StorageError const& error) {
        return error;
    }
    for (Digest const& digest : unneeded) {
        freed += removeFile(layout.fileOf({{}, digest}), 1);
    }
    return std::nullopt;
}

/// Cleans the stores one by one. One that cannot be cleaned stays as it is; returns why, of the first such store.
std::optional<StorageError> cleanStores(StorageLayout const& layout, Needed const& needed, Freed& freed)
{
    std::optional<StorageError> firstError;
    for (auto const& [store, path] : storesIn(layout)) {
        if (needed.storesLeftAlone.count(store) > 0) {
            continue;
        }
        try {
            freed += reduceStore(path, nameOfStore(store), needed.revisionsIn(store), layout.scratchFolder());
        } catch (StorageError const& error) {
            firstError = firstError ? firstError : error;
        }
    }
    return firstError;
}

void flushFolders(StorageLayout const& layout)
{
    for (std::string const& folder : {layout.objectFolder(), layout.storeFolder()}) {
        if (exists(folder)) {
            flushFolder(folder);
        }
    }
}

} // namespace

void Needed::add(StorageUrl const& url)
{
    (url.isObject() ? objects : revisions[url.store]).insert(url.digest);
}

std::set<Digest> Needed::revisionsIn(std::string const& store) const
{
    auto const found = revisions.find(store);
    return found == revisions.end() ? std::set<Digest>() : found->second;
}

Freed removeUnneeded(StorageLayout const& layout, Needed const& needed)
{
    Freed freed = removeLeftovers(layout);
    std::optional<StorageError> const objectError = cleanObjects(layout, needed.objects, freed);
    std::optional<StorageError> const storeError = cleanStores(layout, needed, freed);
    std::optional<StorageError> const error = objectError ? objectError : storeError;
    flushFolders(layout);
    if (error) {
        throw StorageError(*error);
    }
    return freed;
}

Freed removeLeftovers(StorageLayout const& layout)
{
    Freed freed = removeAllIn(layout.incomingFolder());
    freed += removeAllIn(layout.restoringFolder());
    for (std::string const& name : entriesOf(layout.storeFolder())) {
        if (StorageLayout::isNewForm(name)) {
            freed += removeFile(layout.storeFolder() + "/" + name, 0);
        }
    }
    return freed;
}

} // namespace tav
