#include "host/storage/cleaning.h"

#include "host/storage/files.h"
#include "host/storage/inventory.h"
#include "host/storage/reduced_store.h"
#include "host/storage/storage_error.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <sys/stat.h>

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

Freed cleanObjects(StorageLayout const& layout, std::set<Digest> const& needed)
{
    Freed freed;
    for (Digest const& digest : objectsIn(layout)) {
        if (needed.count(digest) == 0) {
            freed += removeFile(layout.fileOf({{}, digest}), 1);
        }
    }
    return freed;
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
    freed += cleanObjects(layout, needed.objects);
    std::optional<StorageError> const error = cleanStores(layout, needed, freed);
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
