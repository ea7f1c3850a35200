/// The URLs of this storage: "tf:NAME#DIGEST" and "po:DIGEST" (docs/formats/storage.md).
#pragma once

#include "host/storage/record.h"

#include "platform/sdk/OdString.h"

#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// What a URL says.
struct StorageUrl {
    std::string store; ///< name of the revision store; empty for an object
    DigestBytes digest{};

    bool isObject() const { return store.empty(); }
    OdString text() const;
};

/// Takes a URL apart. None unless it has exactly one of the two forms: a DIGEST of 64 lower-case hexadecimal digits,
/// and a NAME of at most 100 ASCII letters, digits, '-', '_' and '.' that does not begin with a dot. So a NAME is
/// safe as the name of a file, whoever sent the URL.
std::optional<StorageUrl> parseUrl(OdString const& url);

/// The SHA-256 digest, in lower-case hexadecimal digits, of the content that `url` names; none when `url` is not of
/// this storage (`parseUrl`).
std::optional<OdString> digestOf(OdString const& url);

/// The part of `url`, in bytes, where a URL has its digest. What is there is not checked.
std::string_view digestIn(std::string_view url);

/// Whether `name` can be a NAME.
bool isStoreName(std::string const& name);

/// A NAME for the store of the drawing `path`, a path in the repository, whose first content is `digest`: what is
/// legible of its stem, and a digest of both, so that storing it again after an interruption gives the same.
std::string newStoreName(OdString const& path, DigestBytes const& digest);

} // namespace tav
