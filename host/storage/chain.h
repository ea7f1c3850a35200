/// Chains: the records that lead from a whole content to another one.
#pragma once

#include "host/storage/content_cache.h"
#include "host/storage/frames.h"
#include "host/storage/record_file.h"
#include "host/text/digest.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace tav {

/// A delta may build on another one. At most this many lead from a whole content to any other.
inline constexpr std::size_t kLongestChain = 32;
/// The same for contents longer than a segment: each step on the way goes through a file.
inline constexpr std::size_t kLongestLargeChain = 8;

/// What is read or stored is remembered up to this length: longer contents would drive out the base that is needed
/// next.
inline constexpr std::uint64_t kLongestRemembered = std::uint64_t{1} << 24;

/// A record and the file that it is in.
struct Link {
    std::shared_ptr<RecordFile const> file;
    std::size_t index = 0;

    Record const& record() const { return file->entries()[index].record; }
};

/// Finds the record of a base. Throws `StorageError` when there is none.
using FindBase = std::function<Link(Digest const& base)>;

/// Finds the bases of revisions in their own `store`, of each the newest.
FindBase basesIn(std::shared_ptr<RecordFile const> const& store);

/// `link` and the records that it builds on, the whole one last. Only headers are read. Throws `StorageError` when one
/// is missing or there are too many.
std::vector<Link> chainOf(Link const& link, FindBase const& findBase);

/// Whether a content may build on the one that `chain` leads to.
bool hasRoom(std::vector<Link> const& chain);

/// Reads contents, and remembers the last ones as bases for others. Throws `StorageError`. One thread at a time.
class ChainReader {
public:
    /// Large contents on the way are in files without names in the folder `scratch`.
    explicit ChainReader(std::string scratch) : scratch_(std::move(scratch)) {}

    /// Gives `sink` the content of `link`, and throws if it was not the right one: nothing that `sink` got may be
    /// trusted before this has returned. The frames of `link` are read in any case.
    void read(Link const& link, FindBase const& findBase, Sink const& sink);
    /// The content of `link`, checked, or as it was remembered.
    std::shared_ptr<Content const> load(Link const& link, FindBase const& findBase);
    /// Remembers a content that those read next may build on.
    void remember(Digest const& digest, std::shared_ptr<Content const> content)
    {
        cache_.add(digest, std::move(content));
    }

private:
    /// A content that another one builds on: remembered, or made for this purpose.
    struct Base {
        std::shared_ptr<Content const> remembered;
        Content made;
        Content const* content = nullptr;
    };

    std::vector<Link> chainFromRemembered(Link const& link, FindBase const& findBase) const;
    void loadBase(std::vector<Link> const& chain, Base& base, Buffer& spare);

    std::string scratch_;
    ContentCache cache_;
};

} // namespace tav
