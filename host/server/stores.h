/// What the core of a server works on.
#pragma once

#include "host/server/content_store.h"
#include "host/server/history_store.h"
#include "host/server/parts.h"

#include <cstdint>
#include <functional>
#include <string>

namespace tav {

struct Stores {
    HistoryStore& history;
    ContentStore& contents;
    Parts const& parts;
    std::function<std::int64_t()> now; ///< seconds since 1970-01-01T00:00:00Z
    std::string scratch;               ///< a folder for files without names
};

} // namespace tav
