#include "host/server/embedded_server.h"

#include "host/protocol/refusal.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"
#include "platform/ut/FileName.h"

#include <ctime>
#include <exception>
#include <utility>

namespace tav {

namespace {

constexpr mode_t kFolderPermissions = 0777;

/// What `work` gives, or the error that it throws.
template <class Result, class Work>
Result guarded(Work const& work)
{
    try {
        return work();
    } catch (...) {
        return errorOf(std::current_exception());
    }
}

} // namespace

EmbeddedServer::Opened::Opened(std::string const& folder, Clock const& clock)
    : history(folder + "/server.db")
    , contents(folder + "/contents")
    , parts(folder + "/uploads")
    , core({history, contents, parts, clock, folder})
{
}

EmbeddedServer::EmbeddedServer(std::string folder, Missing missing, Clock clock)
    : folder_(std::move(folder))
    , missing_(missing)
    , clock_(std::move(clock))
{
}

Expected<OdString> EmbeddedServer::request(OdString const& verb, OdString const& document)
{
    return guarded<Expected<OdString>>([&] { return core().answer(verb, document); });
}

WriteOutcome
EmbeddedServer::send(OdString const& repository, UploadName const& upload, std::uint64_t offset, std::string_view bytes)
{
    return guarded<WriteOutcome>([&] {
        core().send(repository, upload, offset, bytes);
        return std::monostate();
    });
}

WriteOutcome EmbeddedServer::receive(
    OdString const& repository, OdString const& record, std::uint64_t offset,
    std::function<bool(std::string_view)> const& sink)
{
    return guarded<WriteOutcome>([&] {
        core().receive(repository, record, offset, sink);
        return std::monostate();
    });
}

std::int64_t EmbeddedServer::systemTime()
{
    return std::time(nullptr);
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
    opened_ = std::make_unique<Opened>(folder_, clock_);
    return opened_->core;
}

} // namespace tav
