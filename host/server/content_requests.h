/// Which contents a server has, and how they get to a client.
#pragma once

#include "host/protocol/content_document.h"
#include "host/server/stores.h"

#include <cstdint>
#include <functional>
#include <string_view>
#include <vector>

namespace tav {

/// The offered contents that the repository lacks, each with the best base to send it with. Those that are there are
/// kept for a while from now on, even if no commit comes.
std::vector<MissingContent> missingOf(Stores& stores, OdString const& repository, Offer const& offer);

/// The records that lead to the wanted contents from those that the client has.
Located located(Stores& stores, OdString const& repository, WantedContents const& wanted);

/// Passes the bytes of a record from `offset` on to `sink`, piece by piece, until it returns false.
void sendRecord(
    Stores& stores, OdString const& repository, Digest const& record, std::uint64_t offset,
    std::function<bool(std::string_view)> const& sink);

} // namespace tav
