/// Digests of contents.
#pragma once

#include <array>
#include <optional>
#include <string>
#include <string_view>

namespace common {
class ContentDigest;
}

namespace tav {

/// The SHA-256 digest of a content, as bytes. It is text only where it leaves the program, in URLs, documents, tables
/// and names of files: 64 lower-case hexadecimal digits.
using Digest = std::array<unsigned char, 32>;

/// `digest` as text.
std::string hexOf(Digest const& digest);

/// The digest that `hex` writes; none when it is anything but 64 lower-case hexadecimal digits.
std::optional<Digest> digestFromHex(std::string_view hex);

/// The digest of what was added to `content`, which takes no more.
Digest finish(common::ContentDigest& content);

} // namespace tav
