#include "host/server/uploads.h"

#include "host/protocol/document.h"
#include "host/protocol/refusal.h"
#include "host/server/stored_contents.h"
#include "host/storage/files.h"
#include "host/storage/storage_error.h"

#include "common/mu_common_versions.h"
#include "platform/os/os_open_file.h"

#include <algorithm>
#include <exception>
#include <optional>
#include <set>
#include <string>
#include <utility>

namespace tav {

namespace {

constexpr std::int64_t kDay = std::int64_t{24} * 60 * 60;
constexpr std::size_t kPiece = std::size_t{1} << 20;
constexpr std::size_t kFewFiles = 8; // Single flushes cost less than one of the whole file system.
constexpr char const* kAnnounce = "Announce it again to learn where it goes on.";
constexpr char const* kSendAgain = "Send it again.";

Failure notUnderWay(std::int64_t upload)
{
    return refusal(
        ServerError::offsetMismatch, "The upload " + std::to_string(upload) + " is not under way.", kAnnounce);
}

/// One of another folder is not told apart from one that there is not.
Upload uploadOrFail(HistorySnapshot const& history, UploadName const& name)
{
    auto const upload = history.upload(name.upload);
    if (!upload || upload->folder != name.folder) {
        throw notUnderWay(name.upload);
    }
    return *upload;
}

Failure lacksBase(Digest const& base)
{
    return refusal(
        ServerError::contentsMissing, "The server lacks the base '" + hexOf(base) + "'.",
        "Ask which contents are missing, and send the record whole.");
}

Failure damaged(std::string const& why)
{
    return refusal(ServerError::damagedUpload, "The record that was sent " + why + ".", kSendAgain);
}

std::int64_t longestChain(std::uint64_t length)
{
    bool const isLarge = length > std::uint64_t{1} << kSegmentLog;
    return static_cast<std::int64_t>(isLarge ? kLongestLargeChain : kLongestChain);
}

/// Throws unless the bytes of the file are the record that was announced.
void requireBytes(os::OpenFile const& file, Upload const& upload)
{
    common::ContentDigest digest;
    std::string piece(kPiece, '\0');
    for (std::uint64_t offset = 0; offset < upload.recordLength; offset += piece.size()) {
        std::size_t done = 0;
        check(file.readAt(offset, piece.data(), piece.size(), done), "The upload cannot be read");
        digest.update(piece.data(), done);
    }
    if (finish(digest) != upload.record) {
        throw damaged("has another digest than the one announced");
    }
}

/// Looks at the header alone: nothing is unpacked that cannot be right.
Record headerOf(os::OpenFile const& file, Upload const& upload)
{
    std::string bytes(kHeaderLength, '\0');
    std::size_t done = 0;
    check(file.readAt(0, bytes.data(), bytes.size(), done), "The upload cannot be read");
    auto const header = parseHeader({bytes.data(), done});
    if (!header || header->framesLength != upload.recordLength - kHeaderLength) {
        throw damaged("is not a record, or has another length");
    }
    if (header->digest != upload.digest || header->base != upload.base || header->segmentLog != kSegmentLog) {
        throw damaged("is of another content, base or segment length");
    }
    if (header->length > kLongestContent) {
        throw refusal(
            ServerError::tooLarge, "The content is longer than " + std::to_string(kLongestContent) + " bytes.",
            kNothingChanged);
    }
    return *header;
}

/// How many differences lead to a content that builds on `base`.
std::int64_t chainOn(HistorySnapshot const& history, Digest const& base, std::uint64_t length)
{
    if (base == Digest{}) {
        return 0;
    }
    auto const there = history.content(base);
    if (!there) {
        throw lacksBase(base);
    }
    if (there->chain >= longestChain(std::max(length, there->length))) {
        throw damaged("builds on a content that has too long a chain");
    }
    return there->chain + 1;
}

void requireContent(Stores& stores, OdString const& repository, Upload const& upload, std::string const& path)
{
    try {
        auto const file = std::make_shared<RecordFile const>(RecordFile::openForReading(path, "The upload"));
        FindBase const find = contentsOf(stores, repository);
        ChainReader(stores.scratch).read({file, 0}, find, [](std::string_view) {});
    } catch (StorageError const& error) {
        if (error.code != 0) {
            throw;
        }
        if (upload.base != Digest{} && !isReadable(stores, repository, upload.base)) {
            throw lacksBase(upload.base);
        }
        throw damaged("does not give the content that it names");
    }
}

/// The content that the record in the file `path` is. Nothing has changed yet.
StoredContent checked(Stores& stores, OdString const& repository, Upload const& upload, std::string const& path)
{
    os::OpenFile file;
    check(file.openForReading(path), "The upload cannot be opened");
    requireBytes(file, upload);
    Record const header = headerOf(file, upload);
    StoredContent content{upload.digest, upload.id, upload.record, upload.base};
    content.chain = chainOn(*stores.history.read(repository), upload.base, header.length);
    content.length = header.length;
    content.recordLength = upload.recordLength;
    content.leased = stores.now() + kLease;
    requireContent(stores, repository, upload, path);
    return content;
}

/// The number of the content of that digest, if its file cannot be read.
std::optional<std::int64_t> damagedFile(Stores& stores, OdString const& repository, Digest const& digest)
{
    auto const there = stores.history.read(repository)->content(digest);
    bool const isDamaged = there && !isReadable(stores, repository, digest);
    return isDamaged ? std::optional(there->id) : std::nullopt;
}

/// A record that has been read, in a file that is not in its place yet.
struct CheckedRecord {
    StoredContent content;
    std::string path;
    std::optional<std::int64_t> damagedFile; ///< of the content that it replaces
};

/// Enters the content, unless there is one that can be read. Returns the number of the file that is not needed. Nothing
/// has changed when it throws.
std::optional<std::int64_t> enter(HistoryTransaction& history, CheckedRecord const& record)
{
    StoredContent content = record.content;
    if (!history.upload(content.id)) {
        throw notUnderWay(content.id);
    }
    if (!content.isWhole() && !history.content(content.base)) {
        throw lacksBase(content.base);
    }
    auto there = history.content(content.digest);
    bool const isReplaced = there && there->id == record.damagedFile && there->id != content.id;
    if (isReplaced && !content.isWhole()) { // Others may build on it: their chains must not grow or close to a circle.
        throw refusal(
            ServerError::contentsMissing,
            "The server has a damaged file of the content '" + hexOf(content.digest) + "'.", "Send it whole.");
    }
    history.removeUpload(content.id);
    if (there && !isReplaced) {
        bool const isOwn = there->id == content.id;
        there->isDamaged = false; // It has been read.
        history.set(*there);
        return isOwn ? std::nullopt : std::optional(content.id);
    }
    content.isNamed = there ? there->isNamed : history.isAwaited(content.digest);
    history.set(content);
    history.removeAwaited(content.digest);
    return there ? std::optional(there->id) : std::nullopt;
}

/// Uploads on their way to become contents: what costs the same for one and for many is done once for all.
class Finishing {
public:
    Finishing(Stores& stores, OdString repository) : stores_(stores), repository_(std::move(repository)) {}
    Finishing(Finishing const&) = delete;
    Finishing& operator=(Finishing const&) = delete;
    ~Finishing() { removeFiles(); }

    /// Checks the record of an upload, and notes it. A refusal is kept for later.
    void add(UploadName const& name);
    /// Makes contents of all that is noted.
    void enter();
    void throwRefusal() const
    {
        if (refusal_) {
            std::rethrow_exception(refusal_);
        }
    }

private:
    template <class Work>
    void keepRefusal(Work const& work);
    bool isNoted(Digest const& digest) const;
    void flush() const;
    void removeFiles() noexcept;

    Stores& stores_;
    OdString repository_;
    std::vector<CheckedRecord> checked_;
    std::exception_ptr refusal_;
};

template <class Work>
void Finishing::keepRefusal(Work const& work)
{
    try {
        work();
    } catch (Failure const& failure) {
        if (failure.code < static_cast<std::int32_t>(ServerError::noServer)) { // The store does not work.
            throw;
        }
        refusal_ = refusal_ ? refusal_ : std::current_exception();
    }
}

void Finishing::add(UploadName const& name)
{
    keepRefusal([&] {
        Upload const upload = uploadOrFail(*stores_.history.read(repository_), name);
        std::uint64_t const length = stores_.parts.length(upload.id);
        if (length < upload.recordLength) {
            throw refusal(
                ServerError::offsetMismatch,
                "The upload has " + std::to_string(length) + " of " + std::to_string(upload.recordLength) + " bytes.",
                kAnnounce);
        }
        if (isNoted(upload.base)) {
            enter();
        }
        checked_.push_back({{}, stores_.parts.take(upload.id), std::nullopt});
        try {
            checked_.back().content = checked(stores_, repository_, upload, checked_.back().path);
            checked_.back().damagedFile = damagedFile(stores_, repository_, upload.digest);
        } catch (...) {
            [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(checked_.back().path);
            checked_.pop_back();
            throw;
        }
    });
}

bool Finishing::isNoted(Digest const& digest) const
{
    return std::any_of(
        checked_.begin(), checked_.end(), [&](CheckedRecord const& record) { return record.content.digest == digest; });
}

void Finishing::flush() const
{
    if (checked_.size() > kFewFiles) {
        os::OpenFile fileSystem;
        check(fileSystem.openFolder(stores_.scratch), "'" + stores_.scratch + "' cannot be opened");
        std::error_code const error = fileSystem.flushFileSystem();
        if (error != std::errc::function_not_supported) {
            return check(error, "The uploads cannot be written");
        }
    }
    for (CheckedRecord const& record : checked_) {
        flushFile(record.path);
    }
}

void Finishing::enter()
{
    if (checked_.empty()) {
        return;
    }
    flush();
    std::vector<NewFile> files;
    for (CheckedRecord const& record : checked_) {
        files.push_back({record.content.id, record.path});
    }
    stores_.contents.put(repository_, files);
    std::vector<std::int64_t> obsolete;
    auto history = stores_.history.write(repository_);
    for (CheckedRecord const& record : checked_) {
        keepRefusal([&] {
            if (auto const file = tav::enter(*history, record)) {
                obsolete.push_back(*file);
            }
        });
    }
    history->commit();
    history.reset();
    checked_.clear();
    for (std::int64_t const id : obsolete) {
        stores_.contents.remove(repository_, id);
    }
}

// What cannot be removed is found by the next cleaning.
void Finishing::removeFiles() noexcept
{
    for (CheckedRecord const& record : checked_) {
        [[maybe_unused]] std::error_code const ignored = os::removeUnflushed(record.path);
    }
}

UploadState begin(Stores& stores, HistoryTransaction& history, OdString const& folder, AnnouncedRecord const& announced)
{
    auto const there = history.content(announced.digest);
    if (there && !there->isDamaged) {
        history.lease({announced.digest}, stores.now() + kLease);
        return {};
    }
    if (announced.base != Digest{}) {
        history.lease({announced.base}, stores.now() + kLease);
    }
    auto const upload = history.upload(folder, announced.record);
    bool const isSame = upload && upload->digest == announced.digest && upload->base == announced.base &&
                        upload->recordLength == announced.recordLength;
    if (isSame) {
        return {upload->id, 0};
    }
    if (upload) { // What was said of these bytes before was wrong, or this is.
        history.removeUpload(upload->id);
    }
    return {
        history.add(
            {0, folder, announced.record, announced.digest, announced.base, announced.recordLength, stores.now()}),
        0};
}

} // namespace

std::vector<UploadState> beginUploads(Stores& stores, OdString const& repository, Announcement const& announcement)
{
    std::set<Digest> announced;
    std::vector<UploadState> uploads;
    auto history = stores.history.write(repository);
    for (AnnouncedRecord const& record : announcement.records) {
        if (record.base != Digest{} && announced.count(record.base) == 0 && !history->content(record.base)) {
            throw lacksBase(record.base);
        }
        uploads.push_back(begin(stores, *history, announcement.folder, record));
        announced.insert(record.digest);
    }
    history->commit();
    history.reset();
    for (UploadState& state : uploads) {
        state.offset = state.upload == 0 ? 0 : stores.parts.begin(state.upload);
    }
    return uploads;
}

void continueUpload(
    Stores& stores, OdString const& repository, UploadName const& name, std::uint64_t offset, std::string_view bytes)
{
    Upload const upload = uploadOrFail(*stores.history.read(repository), name);
    std::uint64_t const length = stores.parts.length(upload.id);
    if (offset > length) {
        throw refusal(
            ServerError::offsetMismatch, "The upload has " + std::to_string(length) + " bytes, and goes on there.",
            kAnnounce);
    }
    if (bytes.size() > upload.recordLength || offset > upload.recordLength - bytes.size()) {
        throw refusal(
            ServerError::tooLarge, "The record has " + std::to_string(upload.recordLength) + " bytes, and no more.",
            kNothingChanged);
    }
    stores.parts.write(upload.id, offset, bytes);
    if (stores.now() - upload.touched > kDay) {
        auto const history = stores.history.write(repository);
        history->touch(upload.id, stores.now());
        history->commit();
    }
}

void finishUploads(Stores& stores, OdString const& repository, SentUploads const& sent)
{
    Finishing finishing(stores, repository);
    for (std::int64_t const upload : sent.uploads) {
        finishing.add({sent.folder, upload});
    }
    finishing.enter();
    finishing.throwRefusal();
}

} // namespace tav
