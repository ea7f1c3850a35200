/// What clients and servers say to each other about contents (docs/formats/server-protocol.md). Any thread.
///
/// The readers throw `Failure` for a document that is refused; the text names the member.
#pragma once

#include "host/protocol/server.h"
#include "host/text/digest.h"

#include "platform/sdk/OdString.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace tav {

/// As many contents one document names at most.
inline constexpr std::size_t kMostContents = 1'000;
/// As many bytes a record has at most, and a content.
inline constexpr std::uint64_t kLongestContent = std::uint64_t{1} << 36;

/// A content that a client has, and those that it could send a difference to.
struct OfferedContent {
    Digest digest{};
    std::vector<Digest> bases;
};

struct Offer {
    std::vector<OfferedContent> contents;
    bool isToCheck = false; ///< a content counts as there only after it has been read
};

/// A content that the server lacks.
struct MissingContent {
    Digest digest{};
    Digest base{}; ///< to send it as a difference to; all zeros: whole
};

Offer readOffer(OdString const& document);
OdString missingAnswer(std::vector<MissingContent> const& missing);

/// A record that a client is going to send.
struct AnnouncedRecord {
    Digest record{};
    Digest digest{};
    Digest base{}; ///< all zeros: none
    std::uint64_t recordLength = 0;
};

struct Announcement {
    OdString folder; ///< 32 lower-case hexadecimal digits that no other working folder has
    std::vector<AnnouncedRecord> records;
};

/// Where an announced record goes on.
struct UploadState {
    std::int64_t upload = 0; ///< 0: its content is there
    std::uint64_t offset = 0;
};

Announcement readAnnouncement(OdString const& document);
OdString uploadsAnswer(std::vector<UploadState> const& uploads);

struct SentUploads {
    OdString folder;
    std::vector<std::int64_t> uploads;
};

SentUploads readSentUploads(OdString const& document);
OdString doneAnswer();

struct WantedContents {
    std::vector<Digest> contents;
    std::vector<Digest> have; ///< contents that records may build on
};

struct LocatedRecord {
    Digest record{};
    Digest digest{};
    Digest base{}; ///< all zeros: none
    std::uint64_t recordLength = 0;
};

struct Located {
    std::vector<LocatedRecord> records; ///< each behind its base
    std::vector<Digest> awaited;        ///< contents that the server does not have
};

WantedContents readWanted(OdString const& document);
OdString locatedAnswer(Located const& located);

} // namespace tav
