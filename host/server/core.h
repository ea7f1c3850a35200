/// What a server does with each request, over the stores that it is given. It knows no transport, no SQL and no paths.
#pragma once

#include "host/protocol/server.h"
#include "host/server/stores.h"

#include "common/mu_common_expected.h"

#include <cstdint>
#include <exception>
#include <functional>
#include <string_view>
#include <utility>

namespace tav {

/// docs/formats/server-protocol.md describes the requests and their documents. What is not carried out throws, and has
/// changed nothing. One thread for each object.
class ServerCore {
public:
    /// Keeps the stores by address.
    explicit ServerCore(Stores stores) : stores_(std::move(stores)) {}

    OdString answer(OdString const& request, OdString const& document);
    void send(OdString const& repository, UploadName const& upload, std::uint64_t offset, std::string_view bytes);
    void receive(
        OdString const& repository, OdString const& record, std::uint64_t offset,
        std::function<bool(std::string_view)> const& sink);

private:
    Stores stores_;
};

/// What a client is told of an exception that one of these has thrown.
ErrorMessage errorOf(std::exception_ptr const& thrown);

} // namespace tav
