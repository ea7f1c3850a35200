/// The interface of a server: requests and answers as documents. A transport, such as HTTP, implements it.
#pragma once

#include "common/mu_common_expected.h"

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <functional>
#include <string_view>

namespace tav {

/// The errors of a server that clients distinguish, as the `code` of the error. System errors have their own codes.
/// A server is out of reach when it is not there, has no room, or is busy, or when it does not answer. All others
/// refuse the request for good.
enum class ServerError : std::int32_t {
    other = 0,
    noServer = 1001,        ///< nothing is where the server was; it may come back
    noRepository = 1002,    ///< it exists, but does not have the repository
    isBehind = 1003,        ///< it lacks commits that the client knows; the client detects that
    hasMovedOn = 1004,      ///< it has commits on the branch that the new one does not follow
    contentsMissing = 1005, ///< it lacks contents that the request builds on
    wrongHash = 1009,       ///< the hash of a commit does not follow from what is in it
    damagedUpload = 1010,   ///< what was sent is not what was announced
    offsetMismatch = 1011,  ///< the upload goes on elsewhere, or is not under way
    referenceExists = 1012, ///< there is such a branch, tag or repository already
    noReference = 1013,     ///< it does not have the commit that is named
    badDocument = 1014,     ///< the request or its document is not valid
    tooLarge = 1015,
    diskFull = 1016,
    busy = 1017, ///< others use it; the same request may succeed later
    inUse = 1018 ///< what others have would be taken away from them
};

/// A record on its way to the server, and the working folder that sends it.
struct UploadName {
    OdString folder; ///< 32 lower-case hexadecimal digits
    std::int64_t upload = 0;
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

    /// Adds `bytes` to the upload, at `offset`. Never throws.
    virtual WriteOutcome
    send(OdString const& repository, UploadName const& upload, std::uint64_t offset, std::string_view bytes) = 0;
    /// Passes the bytes of the record, a digest in hexadecimal digits, to `sink` from `offset` on, piece by piece,
    /// until it returns false. Never throws but what `sink` does.
    virtual WriteOutcome receive(
        OdString const& repository, OdString const& record, std::uint64_t offset,
        std::function<bool(std::string_view)> const& sink) = 0;
};

} // namespace tav
