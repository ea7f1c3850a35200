#include "host/storage/local_storage.h"

#include "host/storage/cleaning.h"
#include "host/storage/storage_error.h"
#include "host/text/characters.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_storage.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <new>
#include <sys/stat.h>
#include <utility>

namespace tav {

namespace {

// Up to here single flushes cost less than one of the whole file system, which others write to as well.
constexpr std::size_t kFewFiles = 8;
constexpr char const* kStoreEnd = ".tf";

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

std::string tavFolder(common::RootPath const& root)
{
    return root.tavPath().ansi_str();
}

std::string storeFolder(common::RootPath const& root)
{
    return tavFolder(root) + "/" + common::repositoryExt().ansi_str();
}

std::string objectFolder(common::RootPath const& root)
{
    return tavFolder(root) + "/objects";
}

/// Where objects lie until they are flushed.
std::string incomingFolder(common::RootPath const& root)
{
    return objectFolder(root) + "/incoming";
}

std::string restoringFolder(common::RootPath const& root)
{
    return tavFolder(root) + "/restoring";
}

/// What messages call a revision store.
std::string nameOfStore(std::string const& store)
{
    return "The revision store '" + store + "'";
}

void makeFolders(std::string const& path)
{
    check(os::makeFolders(path, 0777), "The folder '" + path + "' cannot be made");
}

bool exists(std::string const& path)
{
    struct statx status;
    std::error_code const error = os::examine(path, status);
    if (error != std::errc::no_such_file_or_directory && error != std::errc::not_a_directory) {
        check(error, "'" + path + "' cannot be examined");
    }
    return !error;
}

StorageUrl urlOf(OdString const& text)
{
    std::optional<StorageUrl> const url = parseUrl(text);
    if (!url) {
        throw StorageError(quoted(text) + " is no URL of this storage.");
    }
    return *url;
}

[[noreturn]] void throwMissing(OdString const& url)
{
    throw StorageError(quoted(url) + " is not in the storage.");
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

/// The record that a new revision builds on: the previous one, or, where its chain is full, the whole one that the
/// chain begins with.
std::optional<std::size_t> baseIn(RecordFile const& file, DigestBytes const& previous)
{
    if (file.entries().empty()) {
        return std::nullopt;
    }
    try {
        std::size_t const newest = file.entries().size() - 1;
        std::vector<std::size_t> const chain = file.chainOf(file.find(previous).value_or(newest));
        Record const& last = file.entries()[chain.back()].record;
        std::size_t const longest = last.length > last.segmentLength() ? kLongestLargeChain : kLongestChain;
        return chain.size() <= longest ? chain.back() : chain.front();
    } catch (StorageError const&) {
        return std::nullopt;
    }
}

void flushFile(std::string const& path)
{
    os::OpenFile file;
    check(file.openForReading(path), "'" + path + "' cannot be opened");
    check(file.flush(), "'" + path + "' cannot be written");
}

} // namespace

LocalStorage::LocalStorage(common::RootPath root, LookUp previousUrl, LookUp knownUrl, unsigned segmentLog)
    : root_(std::move(root))
    , previousUrl_(std::move(previousUrl))
    , knownUrl_(std::move(knownUrl))
    , segmentLog_(segmentLog)
{
}

LocalStorage::~LocalStorage()
{
    takeBack();
}

Expected<OdString> LocalStorage::store(OdString const& path)
{
    return guarded<OdString>([&] {
        Content const content =
            openContent(root_.pathTo(path).ansi_str(), quoted(path), std::uint64_t{1} << segmentLog_);
        DigestBytes const digest = digestOf(content);
        auto const stored = batch_.urls.find(digest);
        if (stored != batch_.urls.end()) {
            return stored->second;
        }
        std::optional<StorageUrl> const known = knownPlace(digest);
        StorageUrl const url = known ? *known : newPlace(path, digest);
        if (!known || !isReadable(url)) {
            beginBatch();
            url.isObject() ? keepObject(url, content) : keepDrawing(url, path, content);
        }
        return batch_.urls[digest] = url.text();
    });
}

Expected<bool> LocalStorage::repair(OdString const& text, OdString const& path)
{
    return guarded<bool>([&] {
        StorageUrl const url = urlOf(text);
        if (isReadable(url)) {
            return false;
        }
        Content const content =
            openContent(root_.pathTo(path).ansi_str(), quoted(path), std::uint64_t{1} << segmentLog_);
        if (digestOf(content) != url.digest) {
            throw StorageError(quoted(path) + " has another content by now.");
        }
        beginBatch();
        url.isObject() ? keepObject(url, content) : keepDrawing(url, path, content);
        flushBatch();
        read(text, [](std::string_view) {});
        return true;
    });
}

// Where it should be: what is damaged or gone there is mended for all commits that name it.
std::optional<StorageUrl> LocalStorage::knownPlace(DigestBytes const& digest) const
{
    std::optional<StorageUrl> url = knownUrl_ ? parseUrl(knownUrl_(fromUtf8(hexOf(digest)))) : std::nullopt;
    return url && url->digest == digest ? url : std::nullopt;
}

StorageUrl LocalStorage::newPlace(OdString const& path, DigestBytes const& digest) const
{
    if (common::fileToType(path) != common::StorageType::Tf) {
        return {{}, digest};
    }
    StorageUrl const previous = previousVersion(path);
    return {previous.isObject() ? newStoreName(path, digest) : previous.store, digest};
}

// Opened before anything is written: what fails on the disk from here on is seen when it is flushed.
void LocalStorage::beginBatch()
{
    if (!batch_.fileSystem.isOpen()) {
        check(batch_.fileSystem.openFolder(tavFolder(root_)), "'" + tavFolder(root_) + "' cannot be opened");
    }
}

void LocalStorage::keepObject(StorageUrl const& url, Content const& content)
{
    std::string const path = pathOf(url);
    makeFolders(incomingFolder(root_));
    batch_.folders.insert(objectFolder(root_));
    if (isReadable(url)) { // Perhaps of an interrupted operation that has not flushed the folder.
        return;
    }
    bool const isNew = !exists(path);
    std::string const incoming = incomingFolder(root_) + "/" + hexOf(url.digest);
    [[maybe_unused]] std::error_code const mostlyMissing = os::removeUnflushed(incoming);
    try {
        RecordFile file = RecordFile::create(incoming, "The object " + quoted(url.text()));
        file.append(content, url.digest, nullptr, segmentLog_);
        batch_.objects[path] = {incoming, isNew};
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(incoming);
        throw;
    }
}

StorageUrl LocalStorage::previousVersion(OdString const& path) const
{
    std::optional<StorageUrl> const previous = previousUrl_ ? parseUrl(previousUrl_(path)) : std::nullopt;
    return previous.value_or(StorageUrl());
}

// What was found damaged is kept whole: others may build on it, and their chains do not get longer by that.
void LocalStorage::keepDrawing(StorageUrl const& url, OdString const& path, Content const& content)
{
    std::string const file = pathOf(url);
    std::string const name = nameOfStore(url.store);
    makeFolders(storeFolder(root_));
    batch_.folders.insert(storeFolder(root_));
    bool const isNew = !exists(file);
    RecordFile store = isNew ? RecordFile::create(file, name) : RecordFile::openForChanging(file, name);
    batch_.storeLengths.emplace(file, store.end());
    if (store.find(url.digest) && isReadable(url)) { // Of an interrupted operation; perhaps not flushed.
        return;
    }
    try {
        bool const isWhole = store.isNamed(url.digest);
        loadBase(store, isWhole ? std::nullopt : baseIn(store, previousVersion(path).digest), tavFolder(root_));
        store.append(content, url.digest, base_ ? &*base_ : nullptr, segmentLog_);
        if (base_ && !base_->content.isInMemory()) {
            base_.reset();
        }
    } catch (...) {
        if (isNew) {
            [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(file);
            batch_.storeLengths.erase(file);
        }
        throw;
    }
}

void LocalStorage::loadBase(RecordFile const& store, std::optional<std::size_t> index, std::string const& scratch)
{
    base_.reset();
    if (!index) {
        return;
    }
    try {
        base_ = {store.entries()[*index].record.digest, store.load(*index, scratch)};
    } catch (StorageError const&) {
        return; // Nothing is built on a damaged content.
    }
}

WriteOutcome LocalStorage::flush()
{
    return guarded([&] { flushBatch(); });
}

void LocalStorage::flushBatch()
{
    try {
        flushContents();
        for (auto const& [path, object] : batch_.objects) {
            check(os::renameUnflushed(object.incoming, path), "'" + path + "' cannot be made");
        }
        for (std::string const& folder : batch_.folders) {
            check(os::flushFolder(folder), "'" + folder + "' cannot be written");
        }
    } catch (...) {
        takeBack();
        throw;
    }
    batch_ = Batch();
}

void LocalStorage::flushContents() const
{
    if (batch_.objects.size() + batch_.storeLengths.size() > kFewFiles) {
        std::error_code const error = batch_.fileSystem.flushFileSystem();
        if (error != std::errc::function_not_supported) {
            return check(error, "The storage cannot be written");
        }
    }
    for (auto const& [path, object] : batch_.objects) {
        flushFile(object.incoming);
    }
    for (auto const& [path, length] : batch_.storeLengths) {
        flushFile(path);
    }
}

// What cannot be taken back is in nobody's way: torn tails and incoming objects are dropped later, whole ones found.
void LocalStorage::takeBack() noexcept
{
    std::error_code ignored;
    for (auto const& [path, object] : batch_.objects) {
        ignored = os::removeUnflushed(object.incoming);
        if (object.isNew) {
            ignored = os::removeUnflushed(path);
        }
    }
    for (auto const& [path, length] : batch_.storeLengths) {
        os::OpenFile store;
        if (length == 0) {
            ignored = os::removeUnflushed(path);
        } else if (!store.openForChanging(path)) {
            ignored = store.truncate(length);
        }
    }
    batch_ = Batch();
}

std::string LocalStorage::pathOf(StorageUrl const& url) const
{
    if (!url.isObject()) {
        return storeFolder(root_) + "/" + url.store + kStoreEnd;
    }
    std::string const path = objectFolder(root_) + "/" + hexOf(url.digest);
    auto const incoming = batch_.objects.find(path);
    return incoming == batch_.objects.end() ? path : incoming->second.incoming;
}

bool LocalStorage::isKept(OdString const& text) const
{
    StorageUrl const url = urlOf(text);
    std::string const path = pathOf(url);
    if (url.isObject() || !exists(path)) {
        return exists(path);
    }
    return RecordFile::openForReading(path, "The store of " + quoted(text)).find(url.digest).has_value();
}

bool LocalStorage::isReadable(StorageUrl const& url) const
{
    try {
        read(url.text(), [](std::string_view) {});
        return true;
    } catch (StorageError const&) {
        return false;
    }
}

LocalStorage::Found LocalStorage::find(OdString const& text) const
{
    StorageUrl const url = urlOf(text);
    std::string const path = pathOf(url);
    if (!exists(path)) {
        throwMissing(text);
    }
    std::string const name = "The content of " + quoted(text);
    RecordFile file = RecordFile::openForReading(path, name);
    std::optional<std::size_t> const index = file.find(url.digest);
    if (index) {
        return {std::move(file), *index};
    }
    if (url.isObject()) {
        throw StorageError(name + " is damaged.");
    }
    throwMissing(text);
}

void LocalStorage::read(OdString const& url, Sink const& sink) const
{
    Found const found = find(url);
    found.file.read(found.index, tavFolder(root_), base_ ? &*base_ : nullptr, sink);
}

WriteOutcome LocalStorage::read(OdString const& url, std::function<bool(char const*, std::size_t)> const& sink)
{
    return guarded([&] {
        read(url, [&](std::string_view piece) {
            if (!sink(piece.data(), piece.size())) {
                throw StorageError("The content of " + quoted(url) + " was not read to its end.");
            }
        });
    });
}

WriteOutcome LocalStorage::verify(OdString const& url)
{
    return guarded([&] { read(url, [](std::string_view) {}); });
}

void LocalStorage::extractTo(OdString const& url, std::string const& path) const
{
    Found const found = find(url);
    os::OpenFile file;
    check(file.create(path, 0666), "'" + path + "' cannot be made");
    std::uint64_t offset = 0;
    try {
        found.file.read(found.index, tavFolder(root_), nullptr, [&](std::string_view piece) {
            check(file.writeAt(offset, piece), "'" + path + "' cannot be written");
            offset += piece.size();
        });
    } catch (...) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(path);
        throw;
    }
}

WriteOutcome LocalStorage::extract(OdString const& url, std::string const& path)
{
    return guarded([&] { extractTo(url, path); });
}

Expected<bool> LocalStorage::contains(OdString const& url)
{
    return guarded<bool>([&] { return isKept(url); });
}

Expected<std::uint64_t> LocalStorage::size(OdString const& url)
{
    return guarded<std::uint64_t>([&] {
        Found const found = find(url);
        return found.file.entries()[found.index].record.length;
    });
}

namespace {

bool endsWith(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

/// The revision stores of a repository: the name of each, and its path.
std::map<std::string, std::string> storesOf(common::RootPath const& root)
{
    std::map<std::string, std::string> stores;
    for (std::string const& file : entriesOf(storeFolder(root))) {
        std::string name = file.substr(0, file.rfind('.'));
        if (endsWith(file, kStoreEnd) && isStoreName(name)) {
            stores.emplace(std::move(name), storeFolder(root).append("/").append(file));
        }
    }
    return stores;
}

std::set<OdString> contentsOf(common::RootPath const& root)
{
    std::set<OdString> urls;
    for (std::string const& name : entriesOf(objectFolder(root))) {
        if (auto const digest = digestFromHex(name)) {
            urls.insert(StorageUrl{{}, *digest}.text());
        }
    }
    for (auto const& [name, path] : storesOf(root)) {
        RecordFile const store = RecordFile::openForReading(path, nameOfStore(name));
        for (Entry const& entry : store.entries()) {
            urls.insert(StorageUrl{name, entry.record.digest}.text());
        }
    }
    return urls;
}

/// The steps of `keepOnly` on one repository.
class Cleaning {
public:
    Cleaning(common::RootPath const& root, std::set<OdString> const& urls, std::set<OdString> const& elsewhere)
        : root_(root)
    {
        for (OdString const& text : urls) {
            StorageUrl const url = urlOf(text);
            kept_[url.store].insert(url.digest);
        }
        for (OdString const& text : elsewhere) {
            leftAlone_.insert(urlOf(text).store);
        }
    }

    Freed runOnLeftovers()
    {
        removeLeftovers();
        return freed_;
    }

    Freed run()
    {
        removeLeftovers();
        cleanObjects();
        cleanStores();
        for (std::string const& folder : {objectFolder(root_), storeFolder(root_)}) {
            if (exists(folder)) {
                check(os::flushFolder(folder), "'" + folder + "' cannot be written");
            }
        }
        if (!firstError_.empty()) {
            throw StorageError(firstError_);
        }
        return freed_;
    }

private:
    void removeAllIn(std::string const& folder)
    {
        for (std::string const& name : entriesOf(folder)) {
            if (name != "." && name != "..") {
                removeCounted(std::string(folder).append("/").append(name), 0, freed_);
            }
        }
    }

    void removeLeftovers()
    {
        removeAllIn(incomingFolder(root_));
        removeAllIn(restoringFolder(root_));
        std::string const newEnd = std::string(kStoreEnd) + ".new";
        for (std::string const& name : entriesOf(storeFolder(root_))) {
            if (endsWith(name, newEnd)) {
                removeCounted(storeFolder(root_).append("/").append(name), 0, freed_);
            }
        }
    }

    void cleanObjects()
    {
        std::set<DigestBytes> const& kept = kept_[{}];
        for (std::string const& name : entriesOf(objectFolder(root_))) {
            std::optional<DigestBytes> const digest = digestFromHex(name);
            if (digest && kept.count(*digest) == 0) {
                removeCounted(objectFolder(root_).append("/").append(name), 1, freed_);
            }
        }
    }

    void cleanStores()
    {
        for (auto const& [store, path] : storesOf(root_)) {
            if (leftAlone_.count(store) == 0) {
                reduce(path, store);
            }
        }
    }

    void reduce(std::string const& path, std::string const& store)
    {
        try {
            reduceStore(path, nameOfStore(store), kept_[store], tavFolder(root_), freed_);
        } catch (StorageError const& error) {
            firstError_ = firstError_.empty() ? error.what : firstError_;
        }
    }

    common::RootPath root_;
    std::map<std::string, std::set<DigestBytes>> kept_;
    std::set<std::string> leftAlone_; // names of stores
    Freed freed_;
    std::string firstError_;
};

} // namespace

Expected<std::set<OdString>> LocalStorage::contents()
{
    return guarded<std::set<OdString>>([&] { return contentsOf(root_); });
}

Expected<Freed> LocalStorage::keepOnly(std::set<OdString> const& urls, std::set<OdString> const& elsewhere)
{
    return guarded<Freed>([&] {
        flushBatch();
        return Cleaning(root_, urls, elsewhere).run();
    });
}

Expected<Freed> LocalStorage::removeLeftovers()
{
    return guarded<Freed>([&] {
        flushBatch();
        return Cleaning(root_, {}, {}).runOnLeftovers();
    });
}

} // namespace tav
