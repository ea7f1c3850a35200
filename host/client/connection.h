/// The server that keeps the history of a repository.
#pragma once

#include "host/repository/local_database.h"
#include "host/server/embedded_server.h"

#include <memory>
#include <string>
#include <vector>

namespace tav {

/// Where servers are kept unless the user names a folder: "tav/server" in the user's folder for data.
std::string defaultServerFolder();

/// The folder of a server that the user names, as an absolute path. Throws `Failure` for a URL.
OdString namedServerFolder(std::string const& typed);

/// Throws `Failure` when the folder `server` is inside the working folder and is not hidden: it would be versioned, and
/// going back to an earlier commit would take the server back too.
void failIfInside(OdString const& server, std::string const& workingFolder);

/// The server in `folder`, which is made when it is missing and shall be. Throws `Failure` when it does not answer, or
/// speaks another version than this program.
std::unique_ptr<Server> connect(OdString const& folder, EmbeddedServer::Missing missing);

/// Makes a repository on the server in `folder`, which is made when it is missing, and returns its identifier. That is
/// `id`, unless it is empty: copies of a project find each other by it, whatever server they come from.
OdString makeRepository(OdString const& folder, std::string const& name, OdString const& id = OdString());

/// The identifiers of all repositories of the server in `folder`.
std::vector<OdString> repositoriesIn(OdString const& folder);

/// Throws `Failure` when `database` names no server.
void requireServer(LocalDatabase const& database);

/// A server, and a repository that it keeps.
class Connection {
public:
    /// The ones that `database` names. Throws `Failure` when there are none.
    explicit Connection(LocalDatabase const& database);
    Connection(OdString const& serverFolder, OdString repository);

    /// Sends a request for this repository and returns the answer, a JSON text. Throws `Failure` when it is refused;
    /// its code is one of `ServerError`.
    OdString request(char const* verb, OdString const& document);

    OdString const& serverFolder() const { return folder_; }

private:
    OdString folder_;
    OdString repository_;
    std::unique_ptr<Server> server_;
};

} // namespace tav
