/// A server in a folder, for those who share a network drive and run no other.
#pragma once

#include "host/server/server.h"

#include "host/database/commit_tables.h"

#include <optional>
#include <string>

namespace tav {

/// Keeps its repositories in the file "server.db" of a folder. Several processes, also on several machines, may have
/// servers on one folder: a request changes all or nothing, and the others wait for it. One thread for each object.
class EmbeddedServer final : public Server {
public:
    /// The folder, in bytes, is made with the first request when it is missing. Nothing fails before that.
    explicit EmbeddedServer(std::string folder);

    Expected<OdString> request(OdString const& verb, OdString const& document) override;

private:
    OdString answer(OdString const& verb, OdString const& document);
    Database& openDatabase();

    std::string folder_;
    std::optional<Database> database_;
};

} // namespace tav
