/// What tav knows of a server: questions and answers as documents.
#pragma once

#include "common/mu_common_expected.h"

#include "platform/sdk/OdString.h"

#include <cstdint>

namespace tav {

/// The kinds of errors of a server that clients tell apart, as the `code` of the error; apart from those of the system.
enum class ServerError : std::int32_t {
    other = 0,
    noServer = 1001,     ///< the place where it was is empty; it may come back
    noRepository = 1002, ///< it is there, and does not have the repository
    isBehind = 1003,     ///< it lacks commits that the client knows; the client finds that out
    hasMovedOn = 1004    ///< it has commits on the branch that the new one does not follow
};

/// A server, wherever it is. docs/formats/server-protocol.md lists its requests and their documents; nothing else
/// passes between it and tav, so that another transport or another database can stand behind this interface.
class Server {
public:
    Server() = default;
    Server(Server const&) = delete;
    Server& operator=(Server const&) = delete;
    virtual ~Server() = default;

    /// Sends `document` with the request `verb`, which names its repository behind a blank ("fetch 2f0a..."), and
    /// returns the answer, a JSON text. Error: the server refuses the request or cannot be reached; the message is for
    /// people, and nothing has changed on the server. Throws nothing.
    virtual Expected<OdString> request(OdString const& verb, OdString const& document) = 0;
};

} // namespace tav
