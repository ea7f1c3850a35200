/// The URLs of this storage: "tf:NAME#DIGEST" and "po:DIGEST" (docs/formats/storage.md).
#pragma once

#include "host/text/digest.h"

#include "platform/sdk/OdString.h"

#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// The parts of a URL.
struct StorageUrl {
    std::string store; ///< name of the revision store; empty for an object
    Digest digest{};

    bool isObject() const { return store.empty(); }
    OdString text() const;
};

/// Parses a URL. None unless it has exactly one of the two forms: a DIGEST of 64 lower-case hexadecimal digits, and a
/// NAME of at most 100 ASCII letters, digits, '-', '_' and '.' that does not begin with a dot. So a NAME is safe as the
/// name of a file, whoever sent the URL.
std::optional<StorageUrl> parseUrl(OdString const& url);

/// The digest of the content that `url` names; none when `url` is not of this storage (`parseUrl`). The second takes
/// the URL in bytes.
std::optional<Digest> digestOf(OdString const& url);
std::optional<Digest> digestOf(std::string_view url);

/// Whether `name` can be a NAME.
bool isStoreName(std::string_view name);

/// A NAME for the store of the drawing `path`, a path in the repository, whose first content is `digest`: the permitted
/// characters of its stem, and a digest of both, so that storing it again after an interruption gives the same NAME.
std::string newStoreName(OdString const& path, Digest const& digest);

} // namespace tav
