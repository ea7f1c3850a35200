/// A server in a folder, for users who share a network drive and run no other server.
#pragma once

#include "host/protocol/server.h"
#include "host/server/core.h"
#include "host/server/sqlite_history.h"

#include <memory>
#include <string>

namespace tav {

/// The core of a server in this process, over a folder with the file "server.db". Several processes, also on several
/// machines, may have servers on one folder: a request changes all or nothing, and the others wait for it. One thread
/// for each object.
class EmbeddedServer final : public Server {
public:
    /// What becomes of a server that is not there. One that has been moved away must not be mistaken for a new one.
    enum class Missing { isMade, isAnError };

    /// The server in `folder`, in bytes, opened with the first request. Nothing fails before that.
    explicit EmbeddedServer(std::string folder, Missing missing = Missing::isMade);

    Expected<OdString> request(OdString const& verb, OdString const& document) override;

private:
    struct Opened {
        explicit Opened(std::string const& folder) : history(folder + "/server.db"), core(history) {}

        SqliteHistory history;
        ServerCore core;
    };

    ServerCore& core();

    std::string folder_;
    Missing missing_;
    std::unique_ptr<Opened> opened_;
};

} // namespace tav
