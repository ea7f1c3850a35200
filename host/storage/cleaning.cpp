#include "host/storage/cleaning.h"

#include "host/storage/storage_error.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <cerrno>
#include <sys/stat.h>

namespace tav {

namespace {

std::size_t indexOf(RecordFile const& store, DigestBytes const& digest, std::string const& name)
{
    std::optional<std::size_t> const index = store.find(digest);
    if (!index) {
        throw StorageError(name + " lacks a revision that is to be kept.");
    }
    return *index;
}

std::set<std::size_t> neededOf(RecordFile const& store, std::set<DigestBytes> const& digests, std::string const& name)
{
    std::set<std::size_t> needed;
    for (DigestBytes const& digest : digests) {
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
    std::string const& path, std::string const& name, std::set<DigestBytes> const& digests, std::string const& scratch)
{
    RecordFile const reduced = RecordFile::openForReading(path, name);
    for (DigestBytes const& digest : digests) {
        reduced.read(indexOf(reduced, digest, name), scratch, nullptr, [](std::string_view) {});
    }
}

} // namespace

std::vector<std::string> entriesOf(std::string const& folder)
{
    std::vector<std::string> names;
    os::FolderReader const reader = os::openFolder(folder);
    if (!reader && errno != ENOENT) {
        check({errno, std::generic_category()}, "'" + folder + "' cannot be read");
    }
    while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
        names.emplace_back(entry->d_name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

void removeCounted(std::string const& path, std::size_t contents, Freed& freed)
{
    struct statx status;
    check(os::examine(path, status), "'" + path + "' cannot be examined");
    check(os::removeUnflushed(path), "'" + path + "' cannot be removed");
    freed.contents += contents;
    freed.bytes += status.stx_size;
}

void reduceStore(
    std::string const& path, std::string const& name, std::set<DigestBytes> const& digests, std::string const& scratch,
    Freed& freed)
{
    RecordFile const old = RecordFile::openForChanging(path, name);
    std::set<std::size_t> const needed = neededOf(old, digests, name);
    std::size_t const dropped = old.entries().size() - needed.size();
    if (needed.empty()) {
        return removeCounted(path, dropped, freed);
    }
    if (dropped == 0 && old.isClean()) {
        return;
    }
    std::string const newPath = path + ".new";
    try {
        writeReduced(old, needed, newPath, name);
        readBack(newPath, name, digests, scratch);
        check(os::replaceFileBy(path, newPath), name + " cannot be replaced");
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(newPath);
        throw;
    }
    freed.contents += dropped;
    freed.bytes += old.length() - RecordFile::openForReading(path, name).length();
}

} // namespace tav
