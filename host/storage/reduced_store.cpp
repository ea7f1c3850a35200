#include "host/storage/reduced_store.h"

#include "host/storage/record_file.h"
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

std::set<std::size_t> neededOf(RecordFile const& store, std::set<Digest> const& digests, std::string const& name)
{
    std::set<std::size_t> needed;
    for (Digest const& digest : digests) {
        std::vector<std::size_t> const chain = store.chainOf(indexOf(store, digest, name));
        needed.insert(chain.begin(), chain.end());
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
    RecordFile const reduced = RecordFile::openForReading(path, name);
    for (Digest const& digest : digests) {
        reduced.read(indexOf(reduced, digest, name), scratch, nullptr, [](std::string_view) {});
    }
}

} // namespace

Freed reduceStore(
    std::string const& path, std::string const& name, std::set<Digest> const& digests, std::string const& scratch)
{
    RecordFile const old = RecordFile::openForChanging(path, name);
    std::set<std::size_t> const needed = neededOf(old, digests, name);
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
