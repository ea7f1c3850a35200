#include "host/storage/chain.h"

#include "host/storage/storage_error.h"

#include "common/mu_common_versions.h"

#include <utility>

namespace tav {

namespace {

/// The chain of `link` up to the first record after which `isEnough`.
template <class IsEnough>
std::vector<Link> walk(Link const& link, FindBase const& findBase, IsEnough const& isEnough)
{
    std::vector<Link> chain = {link};
    while (!chain.back().record().isWhole() && !isEnough(chain.back().record())) {
        if (chain.size() > kLongestChain) {
            link.file->failAsDamaged();
        }
        chain.push_back(findBase(chain.back().record().base));
    }
    return chain;
}

void requireDigest(Link const& link, Digest const& digest)
{
    if (digest != link.record().digest) {
        link.file->failAsDamaged();
    }
}

} // namespace

FindBase basesIn(std::shared_ptr<RecordFile const> const& store)
{
    return [store](Digest const& base) {
        std::optional<std::size_t> const index = store->find(base);
        if (!index) {
            store->failAsDamaged();
        }
        return Link{store, *index};
    };
}

std::vector<Link> chainOf(Link const& link, FindBase const& findBase)
{
    return walk(link, findBase, [](Record const&) { return false; });
}

bool hasRoom(std::vector<Link> const& chain)
{
    Record const& last = chain.front().record();
    return chain.size() <= (last.length > last.segmentLength() ? kLongestLargeChain : kLongestChain);
}

std::vector<Link> ChainReader::chainFromRemembered(Link const& link, FindBase const& findBase) const
{
    return walk(link, findBase, [this](Record const& record) { return cache_.has(record.base); });
}

// The memory of one content of the chain is used again for the next but one: fresh pages cost as much as unpacking.
void ChainReader::loadBase(std::vector<Link> const& chain, Base& base, Buffer& spare)
{
    if (Record const& first = chain.back().record(); !first.isWhole()) {
        base.remembered = cache_.find(first.base);
        base.content = base.remembered.get();
    }
    for (std::size_t i = chain.size() - 1; i > 0; --i) {
        Content next = chain[i].file->unpack(chain[i].index, base.content, scratch_, std::move(spare));
        spare = base.made.takeMemory();
        base.made = std::move(next);
        base.content = &base.made;
    }
}

void ChainReader::read(Link const& link, FindBase const& findBase, Sink const& sink)
{
    Buffer memory;
    Base base;
    loadBase(chainFromRemembered(link, findBase), base, memory);
    common::ContentDigest digest;
    link.file->unpack(link.index, base.content, memory, [&](std::string_view piece) {
        digest.update(piece.data(), piece.size());
        sink(piece);
    });
    requireDigest(link, finish(digest));
    std::uint64_t const length = link.record().length;
    if (length <= link.record().segmentLength() && length <= kLongestRemembered) {
        remember(link.record().digest, std::make_shared<Content>(std::move(memory), length));
    }
}

std::shared_ptr<Content const> ChainReader::load(Link const& link, FindBase const& findBase)
{
    if (auto remembered = cache_.find(link.record().digest)) {
        return remembered;
    }
    Buffer memory;
    Base base;
    loadBase(chainFromRemembered(link, findBase), base, memory);
    auto content = std::make_shared<Content>(link.file->unpack(link.index, base.content, scratch_, std::move(memory)));
    requireDigest(link, digestOf(*content));
    remember(link.record().digest, content);
    return content;
}

} // namespace tav
