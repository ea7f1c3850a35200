/// The interface of a server: requests and answers as documents. A transport, such as HTTP, implements it.
#pragma once

#include "common/mu_common_expected.h"

#include "platform/sdk/OdString.h"

#include <cstdint>

namespace tav {

/// The errors of a server that clients distinguish, as the `code` of the error. System errors have their own codes.
enum class ServerError : std::int32_t {
    other = 0,
    noServer = 1001,     ///< nothing is where the server was; it may come back
    noRepository = 1002, ///< it exists, but does not have the repository
    isBehind = 1003,     ///< it lacks commits that the client knows; the client detects that
    hasMovedOn = 1004    ///< it has commits on the branch that the new one does not follow
};

/// A server, wherever it is. docs/formats/server-protocol.md lists its requests and their documents; nothing else
/// passes between it and tav, so another transport or another database can implement this interface.
class Server {
public:
    Server() = default;
    Server(Server const&) = delete;
    Server& operator=(Server const&) = delete;
    virtual ~Server() = default;

    /// Sends `document` with the request `verb`, which is followed by a blank and the identifier of its repository
    /// ("fetch 2f0a..."), and returns the answer, a JSON text. Error: the server refuses the request or cannot be
    /// reached; the message is for people, and nothing has changed on the server. Never throws.
    virtual Expected<OdString> request(OdString const& verb, OdString const& document) = 0;
};

} // namespace tav
