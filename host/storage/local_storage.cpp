#include "host/storage/local_storage.h"

#include "host/storage/cleaning.h"
#include "host/storage/files.h"
#include "host/storage/inventory.h"
#include "host/storage/similarity.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_storage.h"

#include "platform/os/os_open_file.h"

#include <cerrno>
#include <new>
#include <utility>

namespace tav {

namespace {

/// Opening a store means reading all its headers, and each version of each drawing in it adds one.
constexpr std::size_t kMostRecordsToJoin = 100;

ErrorMessage withCode(ErrorMessage message, int code)
{
    message.code = code;
    return message;
}

/// The result of `work`, which throws on an error.
template <class T, class Work>
Expected<T> guarded(Work const& work)
{
    try {
        return work();
    } catch (StorageError const& error) {
        return withCode(ErrorMessage(fromUtf8(error.what)), error.code);
    } catch (std::bad_alloc const&) {
        return withCode(ErrorMessage(OdString(L"There is not enough memory to work on the storage.")), ENOMEM);
    }
}

template <class Work>
WriteOutcome guarded(Work const& work)
{
    return guarded<std::monostate>([&] {
        work();
        return std::monostate();
    });
}

StorageUrl urlOf(OdString const& text)
{
    std::optional<StorageUrl> const url = parseUrl(text);
    if (!url) {
        throw StorageError(quoted(text) + " is not a URL of this storage.");
    }
    return *url;
}

/// A file that fits into one segment is read whole: then what is compressed is what was digested.
Content openContent(std::string const& path, std::string const& name, std::uint64_t segmentLength)
{
    os::OpenFile file;
    check(file.openForReading(path), name + " cannot be opened");
    std::uint64_t length = 0;
    check(file.length(length), name + " cannot be read");
    if (length > segmentLength) {
        return {std::move(file), length, name};
    }
    Buffer bytes;
    std::size_t done = 0;
    auto const count = static_cast<std::size_t>(length);
    check(file.readAt(0, bytes.reserve(count + 1), count + 1, done), name + " cannot be read");
    if (done != count) {
        throw StorageError(name + " has changed while it was being stored.");
    }
    return {std::move(bytes), count};
}

/// Packed contents do not get smaller, and long ones take minutes.
bool isWorthEffort(Record const& record)
{
    return canBeCompared(record.length) && record.framesLength < record.length / 4 * 3;
}

/// What `load` returns; null when that is damaged. What the system refuses may work next time, so it is thrown.
template <class Load>
std::shared_ptr<Content const> unlessDamaged(Load const& load)
{
    try {
        return load();
    } catch (StorageError const& error) {
        if (error.code != 0) {
            throw;
        }
        return nullptr;
    }
}

} // namespace

LocalStorage::LocalStorage(common::RootPath root, Versions versions, unsigned segmentLog)
    : root_(std::move(root))
    , versions_(std::move(versions))
    , segmentLog_(segmentLog)
    , layout_(root_)
    , reader_(layout_, batch_)
    , writer_(layout_, batch_, reader_, segmentLog)
{
}

Expected<OdString> LocalStorage::store(OdString const& path)
{
    return guarded<OdString>([&] {
        Content content = open(path);
        Digest const digest = digestOf(content);
        if (auto const stored = batch_.urlOf(digest)) {
            return *stored;
        }
        std::optional<StorageUrl> const known = knownPlace(digest);
        OdString const url = known ? storeAgain(path, content, *known) : storeNew(path, content, digest);
        batch_.addUrl(digest, url);
        reader_.remember(digest, std::move(content));
        return url;
    });
}

// Where it should be: what is damaged or gone there is stored again for all commits that name it. An object is stored
// whole then, since others may build on it.
OdString LocalStorage::storeAgain(OdString const& path, Content const& content, StorageUrl const& url)
{
    if (!reader_.isReadable(url)) {
        std::optional<StorageUrl> const previous = url.isObject() ? std::nullopt : previousVersion(path);
        writer_.write(url, content, previous ? previous->digest : Digest{});
    }
    return url.text();
}

OdString LocalStorage::storeNew(OdString const& path, Content const& content, Digest const& digest)
{
    bool const isDrawing = common::fileToType(path) == common::StorageType::Tf;
    std::optional<StorageUrl> const base = baseFor(path, content, !isDrawing);
    StorageUrl url{{}, digest};
    if (isDrawing) {
        url.store = base ? base->store : newStoreName(path, digest);
    }
    writer_.write(url, content, base ? base->digest : Digest{});
    return url.text();
}

std::optional<StorageUrl> LocalStorage::baseFor(OdString const& path, Content const& content, bool isObject)
{
    std::optional<StorageUrl> const previous = previousVersion(path);
    return previous && previous->isObject() == isObject ? previous : similarContent(path, content, isObject);
}

std::optional<StorageUrl> LocalStorage::similarContent(OdString const& path, Content const& content, bool isObject)
{
    if (!versions_.similar || !canBeCompared(content.length()) || !content.isInMemory()) {
        return std::nullopt;
    }
    std::optional<Samples> samples; // made when there is something to compare with
    for (OdString const& text : versions_.similar(path)) {
        std::optional<StorageUrl> const url = parseUrl(text);
        if (url && url->isObject() == isObject && isSimilar(samples ? *samples : samples.emplace(content), *url)) {
            return url;
        }
    }
    return std::nullopt;
}

/// Also whether it can be read.
bool LocalStorage::isSimilar(Samples& samples, StorageUrl const& url)
{
    try {
        Link const link = reader_.find(url);
        return canBeCompared(link.record().length) && link.file->entries().size() <= kMostRecordsToJoin &&
               samples.resemble(*reader_.load(url));
    } catch (StorageError const& error) {
        if (bases_ && error.code != 0) { // Turning over comes back for it; a commit goes on without.
            throw;
        }
        return false;
    }
}

WriteOutcome LocalStorage::flush()
{
    return guarded([&] { batch_.flush(); });
}

Expected<bool> LocalStorage::repair(OdString const& text, OdString const& path)
{
    return guarded<bool>([&] {
        StorageUrl const url = urlOf(text);
        if (reader_.isReadable(url)) {
            return false;
        }
        Content const content = open(path);
        if (digestOf(content) != url.digest) {
            throw StorageError(quoted(path) + " has changed since.");
        }
        storeAgain(path, content, url);
        batch_.flush();
        reader_.read(url, [](std::string_view) {});
        return true;
    });
}

Expected<Freed> LocalStorage::turnOver(OdString const& text, OdString const& path)
{
    return guarded<Freed>([&] {
        StorageUrl const url = urlOf(text);
        if (!bases_) {
            bases_.emplace(layout_);
        }
        return url.isObject() && bases_->isWhole(url.digest) ? reduceObject(url, path) : Freed();
    });
}

Freed LocalStorage::reduceObject(StorageUrl const& url, OdString const& path)
{
    auto const content = unlessDamaged([&] {
        reader_.read(url, [](std::string_view) {}); // Its own file, even if the content is remembered.
        return reader_.load(url);
    });
    if (!content) {
        return {};
    }
    std::optional<Digest> const base = newBaseFor(url, path, *content);
    if (auto const baseContent = base ? unlessDamaged([&] { return reader_.load({{}, *base}); }) : nullptr) {
        Freed const freed = replaceObject(url, *content, KnownContent{*base, baseContent}, Effort::quick);
        if (freed.bytes > 0) {
            return freed;
        }
    }
    bool const isPromising = isWorthEffort(reader_.find(url).record());
    return isPromising ? replaceObject(url, *content, std::nullopt, Effort::thorough) : Freed();
}

/// What the object can build on without a circle and without making the chain of another one too long.
std::optional<Digest> LocalStorage::newBaseFor(StorageUrl const& url, OdString const& path, Content const& content)
{
    std::optional<StorageUrl> const base = baseFor(path, content, true);
    if (!base) {
        return std::nullopt;
    }
    std::vector<Digest> const chain = bases_->chainOf(base->digest);
    std::size_t const longest = content.length() > std::uint64_t{1} << segmentLog_ ? kLongestLargeChain : kLongestChain;
    std::size_t const above = bases_->deltasAbove(url.digest);
    if (chain.back() == url.digest || above >= longest) {
        return std::nullopt;
    }
    return chain.size() + above <= longest ? chain.front() : chain.back();
}

Freed LocalStorage::replaceObject(
    StorageUrl const& url, Content const& content, std::optional<KnownContent> const& base, Effort effort)
{
    std::string const path = layout_.fileOf(url);
    std::string const incoming = layout_.incomingFileOf(url.digest);
    makeFolders(layout_.incomingFolder());
    writer_.writeObjectTo(incoming, url, content, base, effort);
    try {
        RecordFile const written = RecordFile::openForReading(incoming, "The object " + quoted(url.text()));
        std::uint64_t const before = reader_.find(url).file->length();
        if (written.length() >= before) {
            check(os::removeUnflushed(incoming), "'" + incoming + "' cannot be removed");
            return {};
        }
        flushFile(incoming);
        reader_.readObjectIn(incoming, url);
        batch_.addFolder(layout_.objectFolder());
        check(os::renameUnflushed(incoming, path), "'" + path + "' cannot be made");
        bases_->setBase(url.digest, written.entries().at(0).record.base);
        return {1, before - written.length()};
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(incoming);
        throw;
    }
}

Content LocalStorage::open(OdString const& path) const
{
    return openContent(root_.pathTo(path).ansi_str(), quoted(path), std::uint64_t{1} << segmentLog_);
}

std::optional<StorageUrl> LocalStorage::knownPlace(Digest const& digest) const
{
    std::optional<StorageUrl> url = versions_.known ? parseUrl(versions_.known(digest)) : std::nullopt;
    return url && url->digest == digest ? url : std::nullopt;
}

std::optional<StorageUrl> LocalStorage::previousVersion(OdString const& path) const
{
    return versions_.previous ? parseUrl(versions_.previous(path)) : std::nullopt;
}

Expected<std::set<OdString>> LocalStorage::contents() const
{
    return guarded<std::set<OdString>>([&] { return contentsIn(layout_); });
}

Expected<bool> LocalStorage::contains(OdString const& url) const
{
    return guarded<bool>([&] { return reader_.isKept(urlOf(url)); });
}

Expected<std::uint64_t> LocalStorage::size(OdString const& url) const
{
    return guarded<std::uint64_t>([&] { return reader_.find(urlOf(url)).record().length; });
}

WriteOutcome LocalStorage::read(OdString const& url, std::function<bool(char const*, std::size_t)> const& sink) const
{
    return guarded([&] {
        reader_.read(urlOf(url), [&](std::string_view piece) {
            if (!sink(piece.data(), piece.size())) {
                throw StorageError("The content of " + quoted(url) + " was not read to its end.");
            }
        });
    });
}

WriteOutcome LocalStorage::verify(OdString const& url) const
{
    return guarded([&] { reader_.read(urlOf(url), [](std::string_view) {}); });
}

WriteOutcome LocalStorage::extract(OdString const& url, std::string const& path) const
{
    return guarded([&] { reader_.extract(urlOf(url), path); });
}

Expected<Freed> LocalStorage::keepOnly(std::set<OdString> const& urls, std::set<OdString> const& elsewhere)
{
    return guarded<Freed>([&] {
        batch_.flush();
        Needed needed;
        for (OdString const& url : urls) {
            needed.add(urlOf(url));
        }
        for (OdString const& url : elsewhere) {
            needed.storesLeftAlone.insert(urlOf(url).store);
        }
        return removeUnneeded(layout_, needed);
    });
}

Expected<Freed> LocalStorage::removeLeftovers()
{
    return guarded<Freed>([&] {
        batch_.flush();
        return tav::removeLeftovers(layout_);
    });
}

} // namespace tav
