#include "host/storage/reduced_store.h"

#include "host/storage/chain.h"
#include "host/storage/storage_error.h"
#include "host/storage/storage_layout.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

namespace tav {

namespace {

std::size_t indexOf(RecordFile const& store, Digest const& digest, std::string const& name)
{
    std::optional<std::size_t> const index = store.find(digest);
    if (!index) {
        throw StorageError(name + " lacks a revision that is to be kept.");
    }
    return *index;
}

std::set<std::size_t>
neededOf(std::shared_ptr<RecordFile const> const& store, std::set<Digest> const& digests, std::string const& name)
{
    std::set<std::size_t> needed;
    for (Digest const& digest : digests) {
        for (Link const& link : chainOf({store, indexOf(*store, digest, name)}, basesIn(store))) {
            needed.insert(link.index);
        }
    }
    return needed;
}

void writeReduced(
    RecordFile const& old, std::set<std::size_t> const& needed, std::string const& path, std::string const& name)
{
    RecordFile reduced = RecordFile::create(path, "The new form of " + name);
    for (std::size_t const index : needed) {
        reduced.appendFrom(old, index);
    }
    reduced.flush();
}

void readBack(
    std::string const& path, std::string const& name, std::set<Digest> const& digests, std::string const& scratch)
{
    auto const reduced = std::make_shared<RecordFile const>(RecordFile::openForReading(path, name));
    ChainReader contents(scratch);
    for (Digest const& digest : digests) {
        contents.read({reduced, indexOf(*reduced, digest, name)}, basesIn(reduced), [](std::string_view) {});
    }
}

} // namespace

Freed reduceStore(
    std::string const& path, std::string const& name, std::set<Digest> const& digests, std::string const& scratch)
{
    auto const store = std::make_shared<RecordFile const>(RecordFile::openForChanging(path, name));
    RecordFile const& old = *store;
    std::set<std::size_t> const needed = neededOf(store, digests, name);
    std::size_t const dropped = old.entries().size() - needed.size();
    if (needed.empty()) {
        check(os::removeUnflushed(path), "'" + path + "' cannot be removed");
        return {dropped, old.length()};
    }
    if (dropped == 0 && old.isClean()) {
        return {};
    }
    std::string const newForm = StorageLayout::newFormOf(path);
    try {
        writeReduced(old, needed, newForm, name);
        readBack(newForm, name, digests, scratch);
        check(os::replaceFileBy(path, newForm), name + " cannot be replaced");
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(newForm);
        throw;
    }
    return {dropped, old.length() - RecordFile::openForReading(path, name).length()};
}

} // namespace tav
