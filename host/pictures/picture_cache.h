/// Pictures that have been decoded once.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// Keeps pictures as PNG files by the SHA-256 digest of the content that they show, in a folder of the user's cache.
/// Everything in it can be made again: a cache that cannot be read or written, is damaged or gone, only costs time.
/// Several processes may use one folder. Nothing but its own files is ever removed there.
class PictureCache {
public:
    /// The folder need not exist; it is made for the user alone. All pictures together take at most `maxBytes`; the
    /// oldest make room for new ones.
    PictureCache(std::string folder, std::uint64_t maxBytes);

    /// What was kept for `digest`, 64 hexadecimal digits; empty for a content that has no picture. Nothing when nothing
    /// was kept, or not whole.
    std::optional<std::string> find(std::string const& digest) const;

    /// Keeps `png`, or with an empty one that the content has no picture. One that is longer than a sixteenth of the
    /// limit is not kept.
    void keep(std::string const& digest, std::string_view png) const;

private:
    std::string folderOf(std::string const& digest) const;
    void makeRoom(std::string const& folder, std::uint64_t bytes) const;

    std::string folder_;
    std::uint64_t maxBytesOfPart_;
};

} // namespace tav
