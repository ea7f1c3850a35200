/// The server that keeps the history of a repository.
#pragma once

#include "host/repository/local_database.h"
#include "host/server/embedded_server.h"

#include <memory>
#include <string>

namespace tav {

/// Where servers are kept unless the user names a folder: "tav/server" in the user's folder for data.
std::string defaultServerFolder();

/// The server in `folder`, which is made when it is missing and shall be. Throws `Failure` when it does not answer, or
/// speaks another version than this program.
std::unique_ptr<Server> connect(OdString const& folder, EmbeddedServer::Missing missing);

/// Throws `Failure` when `database` names no server.
void requireServer(LocalDatabase const& database);

/// A server, and a repository that it keeps.
class Connection {
public:
    /// The ones that `database` names. Throws `Failure` when there are none.
    explicit Connection(LocalDatabase const& database);

    /// Sends a request for this repository and returns the answer, a JSON text. Throws `Failure` when it is refused.
    OdString request(char const* verb, OdString const& document);

private:
    std::unique_ptr<Server> server_;
    OdString repository_;
};

} // namespace tav
