#include "host/storage/content_writer.h"

#include "host/storage/files.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"

#include "platform/os/os_open_file.h"

namespace tav {

void ContentWriter::write(StorageUrl const& url, Content const& content, Digest const& base)
{
    batch_.watch(layout_.scratchFolder());
    url.isObject() ? writeObject(url, content, base) : writeRevision(url, content, base);
}

void ContentWriter::writeObject(StorageUrl const& url, Content const& content, Digest const& base)
{
    makeFolders(layout_.incomingFolder());
    batch_.addFolder(layout_.objectFolder());
    if (reader_.isReadable(url)) { // Perhaps of an interrupted operation that has not flushed the folder.
        return;
    }
    std::string const path = layout_.fileOf(url);
    bool const replaces = exists(path);
    std::string const incoming = layout_.incomingFileOf(url.digest);
    bool const isDelta = !replaces && base != Digest{}; // Others may build on a damaged one.
    writeObjectTo(incoming, url, content, isDelta ? loadBase({{}, base}) : std::nullopt);
    batch_.addObject(path, incoming, replaces);
}

void ContentWriter::writeObjectTo(
    std::string const& path, StorageUrl const& url, Content const& content, std::optional<KnownContent> const& base,
    Effort effort) const
{
    [[maybe_unused]] std::error_code ignored = os::removeUnflushed(path); // Mostly missing.
    try {
        RecordFile file = RecordFile::create(path, "The object " + quoted(url.text()));
        file.append(content, url.digest, base ? &*base : nullptr, segmentLog_, effort);
    } catch (...) {
        ignored = os::removeUnflushed(path);
        throw;
    }
}

void ContentWriter::writeRevision(StorageUrl const& url, Content const& content, Digest const& base)
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
        append(url, content, base, store);
    } catch (...) {
        if (isNew) {
            [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(file);
            batch_.forgetStore(file);
        }
        throw;
    }
}

// What was found damaged is kept whole: others may build on it, and their chains do not get longer by that.
void ContentWriter::append(StorageUrl const& url, Content const& content, Digest const& base, RecordFile& store)
{
    std::optional<KnownContent> known;
    if (!store.entries().empty() && !store.isNamed(url.digest)) {
        known = loadBase({url.store, store.find(base) ? base : store.entries().back().record.digest});
    }
    store.append(content, url.digest, known ? &*known : nullptr, segmentLog_);
}

/// The content at `base`, or, where its chain is full, the whole one that the chain begins with. None where it cannot
/// be read: nothing is built on a damaged content.
std::optional<KnownContent> ContentWriter::loadBase(StorageUrl const& base) const
{
    try {
        std::vector<Link> const chain = reader_.chainTo(base);
        StorageUrl const chosen{base.store, (hasRoom(chain) ? chain.front() : chain.back()).record().digest};
        return KnownContent{chosen.digest, reader_.load(chosen)};
    } catch (StorageError const&) {
        return std::nullopt;
    }
}

} // namespace tav
