#include "host/server/embedded_server.h"

#include "host/protocol/refusal.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"
#include "platform/ut/FileName.h"

#include <utility>

namespace tav {

namespace {

constexpr mode_t kFolderPermissions = 0777;

} // namespace

EmbeddedServer::EmbeddedServer(std::string folder, Missing missing) : folder_(std::move(folder)), missing_(missing) {}

Expected<OdString> EmbeddedServer::request(OdString const& verb, OdString const& document)
{
    return answered([&] { return core().answer(verb, document); });
}

ServerCore& EmbeddedServer::core()
{
    if (opened_) {
        return opened_->core;
    }
    if (missing_ == Missing::isAnError && !ut::FileName::fileExists(fromUtf8(folder_ + "/server.db"))) {
        throw refusal(
            ServerError::noServer, "The server folder '" + folder_ + "' is missing.",
            "Connect its drive or move the folder back.");
    }
    if (auto const error = os::makeFolders(folder_, kFolderPermissions)) {
        throw Failure(
            "The folder '" + folder_ + "' cannot be made: " + error.message() + ".",
            "Check your permissions there, or name another folder for the server.");
    }
    opened_ = std::make_unique<Opened>(folder_);
    return opened_->core;
}

} // namespace tav
