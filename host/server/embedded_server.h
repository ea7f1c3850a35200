/// A server in a folder, for users who share a network drive and run no other server.
#pragma once

#include "host/protocol/server.h"

#include "host/history/commit_tables.h"

#include <optional>
#include <string>

namespace tav {

/// Keeps its repositories in the file "server.db" of a folder. Several processes, also on several machines, may have
/// servers on one folder: a request changes all or nothing, and the others wait for it. One thread for each object.
class EmbeddedServer final : public Server {
public:
    /// What becomes of a server that is not there. One that has been moved away must not be mistaken for a new one.
    enum class Missing { isMade, isAnError };

    /// The server in `folder`, in bytes, opened with the first request. Nothing fails before that.
    explicit EmbeddedServer(std::string folder, Missing missing = Missing::isMade);

    Expected<OdString> request(OdString const& verb, OdString const& document) override;

private:
    OdString answer(OdString const& verb, OdString const& document);
    Database& openDatabase();

    std::string folder_;
    Missing missing_;
    std::optional<Database> database_;
};

} // namespace tav
