/// What a server does with each request, over the stores that it is given. It knows no transport, no SQL and no paths.
#pragma once

#include "host/server/history_store.h"

#include "common/mu_common_expected.h"

#include <functional>

namespace tav {

/// docs/formats/server-protocol.md describes the requests and their documents. One thread for each object.
class ServerCore {
public:
    /// Keeps the store by address.
    explicit ServerCore(HistoryStore& history) : history_(history) {}

    /// Answers a request, or throws `Failure`; then nothing has changed.
    OdString answer(OdString const& request, OdString const& document);

private:
    HistoryStore& history_;
};

/// The answer that `work` gives. What it throws becomes the error.
Expected<OdString> answered(std::function<OdString()> const& work);

} // namespace tav
