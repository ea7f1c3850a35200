/// How a record comes to the server, in parts, and becomes a content.
#pragma once

#include "host/protocol/content_document.h"
#include "host/server/stores.h"

#include <cstdint>
#include <string_view>
#include <vector>

namespace tav {

/// Uploads of which nothing comes for so long are given up, in seconds.
inline constexpr std::int64_t kPatienceForUploads = std::int64_t{7} * 24 * 60 * 60;
/// Contents that no commit names are kept for so long.
inline constexpr std::int64_t kLease = std::int64_t{14} * 24 * 60 * 60;

/// Begins the uploads, or finds those that the folder has begun. The answer has one state for each record.
std::vector<UploadState> beginUploads(Stores& stores, OdString const& repository, Announcement const& announcement);

/// Adds bytes to an upload. They may repeat what has come, and do not leave a gap.
void continueUpload(
    Stores& stores, OdString const& repository, UploadName const& name, std::uint64_t offset, std::string_view bytes);

/// Makes the records contents: each is read and checked before it counts. Those that are not refused count, whatever
/// the others are; then the first refusal is thrown.
void finishUploads(Stores& stores, OdString const& repository, SentUploads const& sent);

} // namespace tav
