#include "host/storage/local_storage.h"

#include "host/storage/cleaning.h"
#include "host/storage/inventory.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_storage.h"

#include <cerrno>
#include <new>
#include <utility>

namespace tav {

namespace {

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

} // namespace

LocalStorage::LocalStorage(common::RootPath root, UrlOfPath previousUrl, UrlOfDigest knownUrl, unsigned segmentLog)
    : root_(std::move(root))
    , previousUrl_(std::move(previousUrl))
    , knownUrl_(std::move(knownUrl))
    , segmentLog_(segmentLog)
    , layout_(root_)
    , reader_(layout_, batch_)
    , writer_(layout_, batch_, reader_, segmentLog)
{
}

Expected<OdString> LocalStorage::store(OdString const& path)
{
    return guarded<OdString>([&] {
        Content const content = open(path);
        Digest const digest = digestOf(content);
        if (auto const stored = batch_.urlOf(digest)) {
            return *stored;
        }
        std::optional<StorageUrl> const known = knownPlace(digest);
        StorageUrl const url = known ? *known : newPlace(path, digest);
        if (!known || !reader_.isReadable(url)) {
            writer_.write(url, content, previousVersion(path).digest);
        }
        batch_.addUrl(digest, url.text());
        return url.text();
    });
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
            throw StorageError(quoted(path) + " has another content by now.");
        }
        writer_.write(url, content, previousVersion(path).digest);
        batch_.flush();
        reader_.read(url, [](std::string_view) {});
        return true;
    });
}

Content LocalStorage::open(OdString const& path) const
{
    return openContent(root_.pathTo(path).ansi_str(), quoted(path), std::uint64_t{1} << segmentLog_);
}

// Where it should be: what is damaged or gone there is stored again for all commits that name it.
std::optional<StorageUrl> LocalStorage::knownPlace(Digest const& digest) const
{
    std::optional<StorageUrl> url = knownUrl_ ? parseUrl(knownUrl_(digest)) : std::nullopt;
    return url && url->digest == digest ? url : std::nullopt;
}

StorageUrl LocalStorage::newPlace(OdString const& path, Digest const& digest) const
{
    if (common::fileToType(path) != common::StorageType::Tf) {
        return {{}, digest};
    }
    StorageUrl const previous = previousVersion(path);
    return {previous.isObject() ? newStoreName(path, digest) : previous.store, digest};
}

StorageUrl LocalStorage::previousVersion(OdString const& path) const
{
    std::optional<StorageUrl> const previous = previousUrl_ ? parseUrl(previousUrl_(path)) : std::nullopt;
    return previous.value_or(StorageUrl());
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
    return guarded<std::uint64_t>([&] { return reader_.lengthOf(urlOf(url)); });
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
