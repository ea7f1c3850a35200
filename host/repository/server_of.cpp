#include "host/repository/server_of.h"

#include "host/failure.h"
#include "host/server/embedded_server.h"
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

std::unique_ptr<Server> connect(OdString const& folder)
{
    auto server = std::make_unique<EmbeddedServer>(folder.ansi_str());
    auto const answer = server->request(L"version", OdString::kEmpty);
    if (!answer.hasValue()) {
        throw Failure(answer.error(), "Check the server's folder '" + folder.ansi_str() + "'.");
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

Connection::Connection(LocalDatabase const& database) : repository_(database.repositoryId())
{
    if (repository_.isEmpty()) {
        throw Failure("The repository has no server yet.", "Run 'tav init' to complete it.");
    }
    server_ = connect(database.serverFolder());
}

OdString Connection::request(char const* verb, OdString const& document)
{
    auto const answer = server_->request(OdString(verb, CP_UTF_8) + L" " + repository_, document);
    return valueOrFail(answer, "Your working folder is as it was.");
}

} // namespace tav
