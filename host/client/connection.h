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
/// checking out an earlier commit would put an earlier server in its place.
void failIfInside(OdString const& server, std::string const& workingFolder);

/// The server in `folder`; `missing` says whether a missing one is made. Throws `Failure` when it does not answer, or
/// uses a different version of the protocol. The only place that makes a `Server`.
std::unique_ptr<Server> connect(OdString const& folder, EmbeddedServer::Missing missing);

/// Makes a repository on the server in `folder`, which is made when it is missing, and returns its identifier. The
/// identifier is `id` unless that is empty: copies of a project recognise each other by it on any server.
OdString makeRepository(OdString const& folder, std::string const& name, OdString const& id = OdString());

/// The identifiers of all repositories of the server in `folder`.
std::vector<OdString> repositoriesIn(OdString const& folder);

/// Throws `Failure` when `database` names no server.
void requireServer(LocalDatabase const& database);

/// A connection to a server, for one repository that it keeps.
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
