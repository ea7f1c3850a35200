#include "host/server/content_requests.h"

#include "host/protocol/refusal.h"
#include "host/server/stored_contents.h"
#include "host/server/uploads.h"
#include "host/storage/storage_error.h"

#include <algorithm>
#include <set>

namespace tav {

namespace {

constexpr std::size_t kPiece = std::size_t{1} << 20;

bool hasRoomAbove(StoredContent const& content)
{
    bool const isLarge = content.length > std::uint64_t{1} << kSegmentLog;
    return content.chain < static_cast<std::int64_t>(isLarge ? kLongestLargeChain : kLongestChain);
}

/// The content at the beginning of the chain.
StoredContent beginningOf(HistorySnapshot const& history, StoredContent content)
{
    for (std::size_t i = 0; i <= kLongestChain && !content.isWhole(); ++i) {
        auto const base = history.content(content.base);
        if (!base) {
            break;
        }
        content = *base;
    }
    return content;
}

/// All zeros when there is none.
Digest baseFor(HistorySnapshot const& history, OfferedContent const& offered)
{
    for (Digest const& base : offered.bases) {
        auto const there = history.content(base);
        if (there && !there->isDamaged) {
            return hasRoomAbove(*there) ? base : beginningOf(history, *there).digest;
        }
    }
    return {};
}

/// Reads those of the contents that are there. Returns the ones that cannot be read.
std::set<Digest> damagedOf(Stores& stores, OdString const& repository, Offer const& offer)
{
    std::set<Digest> damaged;
    for (OfferedContent const& offered : offer.contents) {
        bool const isThere = stores.history.read(repository)->content(offered.digest).has_value();
        if (isThere && !isReadable(stores, repository, offered.digest)) {
            damaged.insert(offered.digest);
        }
    }
    return damaged;
}

void note(HistoryTransaction& history, StoredContent content, bool isDamaged)
{
    if (content.isDamaged != isDamaged) {
        content.isDamaged = isDamaged;
        history.set(content);
    }
}

} // namespace

std::vector<MissingContent> missingOf(Stores& stores, OdString const& repository, Offer const& offer)
{
    std::set<Digest> const damaged = offer.isToCheck ? damagedOf(stores, repository, offer) : std::set<Digest>();
    auto const history = stores.history.write(repository);
    std::vector<MissingContent> missing;
    std::vector<Digest> there;
    for (OfferedContent const& offered : offer.contents) {
        auto const content = history->content(offered.digest);
        bool const isDamaged = offer.isToCheck ? damaged.count(offered.digest) > 0 : content && content->isDamaged;
        if (content && offer.isToCheck) {
            note(*history, *content, isDamaged);
        }
        if (!content || isDamaged) {
            missing.push_back({offered.digest, content ? Digest{} : baseFor(*history, offered)});
        } else {
            there.push_back(offered.digest);
        }
    }
    history->lease(there, stores.now() + kLease);
    history->commit();
    return missing;
}

Located located(Stores& stores, OdString const& repository, WantedContents const& wanted)
{
    auto const history = stores.history.read(repository);
    std::set<Digest> known(wanted.have.begin(), wanted.have.end());
    Located result;
    for (Digest const& digest : wanted.contents) {
        std::vector<LocatedRecord> chain;
        Digest next = digest;
        while (next != Digest{} && chain.size() <= kLongestChain && known.count(next) == 0) {
            auto const content = history->content(next);
            if (!content) {
                result.awaited.push_back(next);
                break;
            }
            chain.push_back({content->record, content->digest, content->base, content->recordLength});
            known.insert(next);
            next = content->base;
        }
        result.records.insert(result.records.end(), chain.rbegin(), chain.rend());
    }
    return result;
}

void sendRecord(
    Stores& stores, OdString const& repository, Digest const& record, std::uint64_t offset,
    std::function<bool(std::string_view)> const& sink)
{
    auto const content = stores.history.read(repository)->contentOfRecord(record);
    if (!content) {
        throw refusal(
            ServerError::contentsMissing, "The server does not have the record '" + hexOf(record) + "' any more.",
            "Ask again where its content is.");
    }
    while (offset < content->recordLength) {
        std::string const piece = stores.contents.read(repository, content->id, offset, kPiece);
        if (piece.empty() || !sink(piece)) {
            return;
        }
        offset += piece.size();
    }
}

} // namespace tav
