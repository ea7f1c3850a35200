/// Which objects build on which.
#pragma once

#include "host/storage/storage_layout.h"
#include "host/text/digest.h"

#include <cstddef>
#include <optional>
#include <set>
#include <unordered_map>
#include <vector>

namespace tav {

/// What the headers of all objects say, read once.
class ObjectBases {
public:
    /// Throws `StorageError` when the system refuses to read the folder or a header.
    explicit ObjectBases(StorageLayout const& layout);

    /// An object whose header is damaged: what it builds on is not known. None when there is no such object among
    /// `objects`.
    std::optional<Digest> firstUnknown(std::set<Digest> const& objects) const;
    bool isWhole(Digest const& digest) const; ///< false also when it is unknown
    /// The objects from `digest` down to a whole one, itself first; cut off behind the longest chain that is read.
    std::vector<Digest> chainOf(Digest const& digest) const;
    /// At most so many differences lead from `digest` to another object.
    std::size_t deltasAbove(Digest const& digest) const;
    /// Notes that `digest` builds on `base` from now on.
    void setBase(Digest const& digest, Digest const& base);

private:
    struct Hash {
        std::size_t operator()(Digest const& digest) const;
    };

    void raise(Digest const& digest);

    std::unordered_map<Digest, Digest, Hash> bases_; // all zeros: none
    std::unordered_map<Digest, std::size_t, Hash> deltasAbove_;
};

} // namespace tav
