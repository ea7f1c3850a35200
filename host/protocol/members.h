/// Members that several documents have, each read and checked. All throw `Failure` for one that is refused.
#pragma once

#include "host/protocol/document.h"

#include "platform/sdk/OdString.h"

#include <vector>

namespace tav {

/// Whether `hash` is the name of a commit or content: 64 lower-case hexadecimal digits.
bool isHash(OdString const& hash);

/// Whether `id` can be the identifier of a repository: 32 lower-case hexadecimal digits.
bool isRepositoryId(OdString const& id);

/// Whether `url` names a content that a client can store and find: it has one of the two forms of `parseUrl`.
bool isContentUrl(OdString const& url);

OdString readHash(Part const& part);
/// A path that may be recorded: it leads into the working folder and not into ".tav".
OdString readPath(Part const& part);
OdString readUrl(Part const& part);
/// Hashes of parents: two at most, and not one twice.
std::vector<OdString> readParents(Part const& part);

} // namespace tav
