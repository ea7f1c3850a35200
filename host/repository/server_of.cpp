#include "host/repository/server_of.h"

#include "host/failure.h"
#include "host/user_folders.h"

#include "common/mu_common_serialization.h"

namespace tav {

namespace {

OdString const kVersion = L"1";

} // namespace

std::string defaultServerFolder()
{
    return userFolder("XDG_DATA_HOME", ".local/share") + "/tav/server";
}

std::unique_ptr<Server> connect(OdString const& folder, EmbeddedServer::Missing missing)
{
    auto server = std::make_unique<EmbeddedServer>(folder.ansi_str(), missing);
    auto const answer = server->request(L"version", OdString::kEmpty);
    if (!answer.hasValue()) {
        throw Failure(answer.error(), "The folder of the server is '" + folder.ansi_str() + "'.");
    }
    OdString const version = valueOrFail(common::deserializeServerVersion(answer.value()), "Ask its owner.");
    if (version != kVersion) {
        throw Failure(
            "The server in '" + folder.ansi_str() + "' speaks version " + version.ansi_str() + ", this tav version " +
                kVersion.ansi_str() + ".",
            "Use the tav that belongs to the server.");
    }
    return server;
}

void requireServer(LocalDatabase const& database)
{
    if (database.repositoryId().isEmpty()) {
        throw Failure("The repository has no server yet.", "Run 'tav init' to complete it.");
    }
}

Connection::Connection(LocalDatabase const& database) : repository_(database.repositoryId())
{
    requireServer(database);
    server_ = connect(database.serverFolder(), EmbeddedServer::Missing::isAnError);
}

OdString Connection::request(char const* verb, OdString const& document)
{
    auto const answer = server_->request(OdString(verb, CP_UTF_8) + L" " + repository_, document);
    return valueOrFail(answer, "Your working folder is as it was.");
}

} // namespace tav
