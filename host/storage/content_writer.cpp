#include "host/storage/content_writer.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"

#include "platform/os/os_open_file.h"

namespace tav {

namespace {

/// The record that a new revision builds on: the previous one, or, where its chain is full, the whole one that the
/// chain begins with.
std::optional<std::size_t> baseIn(RecordFile const& store, Digest const& previous)
{
    if (store.entries().empty()) {
        return std::nullopt;
    }
    std::size_t const newest = store.entries().size() - 1;
    std::vector<std::size_t> const chain = store.chainOf(store.find(previous).value_or(newest));
    Record const& last = store.entries()[chain.back()].record;
    std::size_t const longest = last.length > last.segmentLength() ? kLongestLargeChain : kLongestChain;
    return chain.size() <= longest ? chain.back() : chain.front();
}

} // namespace

void ContentWriter::write(StorageUrl const& url, Content const& content, Digest const& previous)
{
    batch_.watch(layout_.scratchFolder());
    url.isObject() ? writeObject(url, content) : writeRevision(url, content, previous);
}

void ContentWriter::writeObject(StorageUrl const& url, Content const& content)
{
    makeFolders(layout_.incomingFolder());
    batch_.addFolder(layout_.objectFolder());
    if (reader_.isReadable(url)) { // Perhaps of an interrupted operation that has not flushed the folder.
        return;
    }
    std::string const path = layout_.fileOf(url);
    bool const replaces = exists(path);
    std::string const incoming = layout_.incomingFileOf(url.digest);
    [[maybe_unused]] std::error_code const mostlyMissing = os::removeUnflushed(incoming);
    try {
        RecordFile file = RecordFile::create(incoming, "The object " + quoted(url.text()));
        file.append(content, url.digest, nullptr, segmentLog_);
        batch_.addObject(path, incoming, replaces);
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(incoming);
        throw;
    }
}

void ContentWriter::writeRevision(StorageUrl const& url, Content const& content, Digest const& previous)
{
    std::string const file = layout_.fileOf(url);
    std::string const name = nameOfStore(url.store);
    makeFolders(layout_.storeFolder());
    batch_.addFolder(layout_.storeFolder());
    bool const isNew = !exists(file);
    RecordFile store = isNew ? RecordFile::create(file, name) : RecordFile::openForChanging(file, name);
    batch_.addStore(file, store.end());
    if (store.find(url.digest) && reader_.isReadable(url)) { // Of an interrupted operation; perhaps not flushed.
        return;
    }
    try {
        append(url, content, previous, store);
    } catch (...) {
        if (isNew) {
            [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(file);
            batch_.forgetStore(file);
        }
        throw;
    }
}

// What was found damaged is kept whole: others may build on it, and their chains do not get longer by that.
void ContentWriter::append(StorageUrl const& url, Content const& content, Digest const& previous, RecordFile& store)
{
    reader_.setBase(std::nullopt); // The next one needs its memory.
    if (!store.isNamed(url.digest)) {
        reader_.setBase(loadBase(store, previous));
    }
    store.append(content, url.digest, reader_.base(), segmentLog_);
    if (reader_.base() != nullptr && !reader_.base()->content.isInMemory()) {
        reader_.setBase(std::nullopt);
    }
}

/// None where it cannot be read: nothing is built on a damaged content.
std::optional<KnownContent> ContentWriter::loadBase(RecordFile const& store, Digest const& previous) const
{
    try {
        std::optional<std::size_t> const index = baseIn(store, previous);
        if (!index) {
            return std::nullopt;
        }
        return KnownContent{store.entries()[*index].record.digest, store.load(*index, layout_.scratchFolder())};
    } catch (StorageError const&) {
        return std::nullopt;
    }
}

} // namespace tav
