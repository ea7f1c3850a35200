#include "host/protocol/content_document.h"

#include "host/protocol/document.h"
#include "host/protocol/members.h"
#include "host/protocol/refusal.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include <optional>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

constexpr wchar_t const* kDigest = L"digest";
constexpr wchar_t const* kBase = L"base";
constexpr wchar_t const* kRecord = L"record";
constexpr wchar_t const* kRecordLength = L"recordLength";
constexpr wchar_t const* kRecords = L"records";
constexpr wchar_t const* kUploads = L"uploads";
constexpr wchar_t const* kDone = L"done";
constexpr wchar_t const* kFolder = L"folder";
constexpr wchar_t const* kContents = L"contents";
constexpr wchar_t const* kAwaited = L"awaited";

Digest readDigest(Part const& part)
{
    return *digestFromHex(readHash(part).ansi_str());
}

/// All zeros where there is none.
Digest readBase(Part const& part)
{
    auto const base = part.optionalMember(kBase);
    return base ? readDigest(*base) : Digest{};
}

/// The number of elements of an array that may not be long.
std::size_t sizeOf(Part const& part)
{
    std::size_t const count = part.size();
    if (count > kMostContents) {
        throw refusal(
            ServerError::tooLarge,
            "The document names " + std::to_string(count) + " contents, and " + std::to_string(kMostContents) +
                " is the most.",
            kNothingChanged);
    }
    return count;
}

std::vector<Digest> readDigests(Part const& part)
{
    std::size_t const count = sizeOf(part);
    std::vector<Digest> digests;
    digests.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        digests.push_back(readDigest(part[i]));
    }
    return digests;
}

OfferedContent readOfferedContent(Part const& part)
{
    OfferedContent offered{readDigest(part.member(kDigest)), {}};
    if (auto const bases = part.optionalMember(L"bases")) {
        offered.bases = readDigests(*bases);
    }
    return offered;
}

std::uint64_t readRecordLength(Part const& part)
{
    std::int64_t const length = part.integer();
    if (length < 0) {
        part.refuse("must not be negative");
    }
    if (static_cast<std::uint64_t>(length) > kLongestContent) {
        throw refusal(
            ServerError::tooLarge, "The record is longer than " + std::to_string(kLongestContent) + " bytes.",
            kNothingChanged);
    }
    return static_cast<std::uint64_t>(length);
}

AnnouncedRecord readAnnouncedRecord(Part const& part)
{
    AnnouncedRecord announced;
    announced.record = readDigest(part.member(kRecord));
    announced.digest = readDigest(part.member(kDigest));
    announced.base = readBase(part);
    announced.recordLength = readRecordLength(part.member(kRecordLength));
    return announced;
}

OdString readFolder(Part const& part)
{
    OdString folder = part.text();
    if (!isRepositoryId(folder)) {
        part.refuse("must be an identifier of 32 lower-case hexadecimal digits");
    }
    return folder;
}

Value digestText(Digest const& digest)
{
    return jsonText(fromUtf8(hexOf(digest)));
}

void setBase(Object& object, Digest const& base)
{
    if (base != Digest{}) {
        object[kBase] = digestText(base);
    }
}

} // namespace

Offer readOffer(OdString const& document)
{
    Value const value = parsed(document);
    Part const whole(value);
    Part const contents = whole.member(kContents);
    std::size_t const count = sizeOf(contents);
    Offer offer;
    for (std::size_t i = 0; i < count; ++i) {
        Part const content = contents[i];
        offer.contents.push_back(readOfferedContent(content));
    }
    auto const check = whole.optionalMember(L"check");
    offer.isToCheck = check && check->truth();
    return offer;
}

OdString missingAnswer(std::vector<MissingContent> const& missing)
{
    Array contents;
    for (MissingContent const& content : missing) {
        Object object;
        setBase(object, content.base);
        object[kDigest] = digestText(content.digest);
        contents.emplace_back(std::move(object));
    }
    Object answer;
    answer[kContents] = std::move(contents);
    return compactText(answer);
}

Announcement readAnnouncement(OdString const& document)
{
    Value const value = parsed(document);
    Part const whole(value);
    Announcement announcement{readFolder(whole.member(kFolder)), {}};
    Part const records = whole.member(kRecords);
    std::size_t const count = sizeOf(records);
    for (std::size_t i = 0; i < count; ++i) {
        Part const record = records[i];
        announcement.records.push_back(readAnnouncedRecord(record));
    }
    return announcement;
}

OdString uploadsAnswer(std::vector<UploadState> const& uploads)
{
    Array array;
    for (UploadState const& state : uploads) {
        Object object;
        if (state.upload == 0) {
            object[kDone] = true;
        } else {
            object[L"offset"] = state.offset;
            object[L"upload"] = state.upload;
        }
        array.emplace_back(std::move(object));
    }
    Object answer;
    answer[kUploads] = std::move(array);
    return compactText(answer);
}

SentUploads readSentUploads(OdString const& document)
{
    Value const value = parsed(document);
    Part const whole(value);
    SentUploads sent{readFolder(whole.member(kFolder)), {}};
    Part const uploads = whole.member(kUploads);
    std::size_t const count = sizeOf(uploads);
    for (std::size_t i = 0; i < count; ++i) {
        sent.uploads.push_back(uploads[i].integer());
    }
    return sent;
}

OdString doneAnswer()
{
    Object answer;
    answer[kDone] = true;
    return compactText(answer);
}

WantedContents readWanted(OdString const& document)
{
    Value const value = parsed(document);
    Part const whole(value);
    WantedContents wanted{readDigests(whole.member(kContents)), {}};
    if (auto const have = whole.optionalMember(L"have")) {
        wanted.have = readDigests(*have);
    }
    return wanted;
}

OdString locatedAnswer(Located const& located)
{
    Array awaited;
    for (Digest const& digest : located.awaited) {
        awaited.emplace_back(digestText(digest));
    }
    Array records;
    for (LocatedRecord const& record : located.records) {
        Object object;
        setBase(object, record.base);
        object[kDigest] = digestText(record.digest);
        object[kRecord] = digestText(record.record);
        object[kRecordLength] = record.recordLength;
        records.emplace_back(std::move(object));
    }
    Object answer;
    answer[kAwaited] = std::move(awaited);
    answer[kRecords] = std::move(records);
    return compactText(answer);
}

} // namespace tav
