#include "host/storage/object_bases.h"

#include "host/storage/chain.h"
#include "host/storage/inventory.h"
#include "host/storage/storage_error.h"

#include <algorithm>
#include <cstring>

namespace tav {

namespace {

/// None for a damaged object.
std::optional<Record> recordOf(StorageLayout const& layout, Digest const& digest)
{
    try {
        RecordFile const file = RecordFile::openForReading(layout.fileOf({{}, digest}), "An object");
        std::optional<std::size_t> const index = file.find(digest);
        return index ? std::optional(file.entries()[*index].record) : std::nullopt;
    } catch (StorageError const& error) {
        if (error.code != 0) {
            throw;
        }
        return std::nullopt;
    }
}

} // namespace

std::size_t ObjectBases::Hash::operator()(Digest const& digest) const
{
    std::size_t hash = 0;
    std::memcpy(&hash, digest.data(), sizeof hash);
    return hash;
}

ObjectBases::ObjectBases(StorageLayout const& layout)
{
    for (Digest const& digest : objectsIn(layout)) {
        if (auto const record = recordOf(layout, digest)) {
            bases_.emplace(digest, record->base);
        }
    }
    for (auto const& [digest, base] : bases_) {
        raise(digest);
    }
}

std::optional<Digest> ObjectBases::firstUnknown(std::set<Digest> const& objects) const
{
    auto const found = std::find_if(
        objects.begin(), objects.end(), [this](Digest const& digest) { return bases_.count(digest) == 0; });
    return found == objects.end() ? std::nullopt : std::optional(*found);
}

bool ObjectBases::isWhole(Digest const& digest) const
{
    auto const found = bases_.find(digest);
    return found != bases_.end() && found->second == Digest{};
}

std::vector<Digest> ObjectBases::chainOf(Digest const& digest) const
{
    std::vector<Digest> chain = {digest};
    while (chain.size() <= kLongestChain + 1) {
        auto const found = bases_.find(chain.back());
        if (found == bases_.end() || found->second == Digest{}) {
            break;
        }
        chain.push_back(found->second);
    }
    return chain;
}

std::size_t ObjectBases::deltasAbove(Digest const& digest) const
{
    auto const found = deltasAbove_.find(digest);
    return found == deltasAbove_.end() ? 0 : found->second;
}

void ObjectBases::setBase(Digest const& digest, Digest const& base)
{
    bases_[digest] = base;
    raise(digest);
}

/// Tells what `digest` builds on how much is above it.
void ObjectBases::raise(Digest const& digest)
{
    std::size_t above = deltasAbove(digest);
    std::vector<Digest> const chain = chainOf(digest);
    for (std::size_t i = 1; i < chain.size(); ++i) {
        std::size_t& known = deltasAbove_[chain[i]];
        known = std::max(known, ++above);
    }
}

} // namespace tav
