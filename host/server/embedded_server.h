/// A server in a folder, for users who share a network drive and run no other server.
#pragma once

#include "host/protocol/server.h"
#include "host/server/core.h"
#include "host/server/folder_contents.h"
#include "host/server/parts.h"
#include "host/server/sqlite_history.h"

#include <memory>
#include <string>

namespace tav {

/// The core of a server in this process, over a folder with the file "server.db" and the folders
/// "contents" and "uploads". Several processes, also on several
/// machines, may have servers on one folder: a request changes all or nothing, and the others wait for it. One thread
/// for each object.
class EmbeddedServer final : public Server {
public:
    /// What becomes of a server that is not there. One that has been moved away must not be mistaken for a new one.
    enum class Missing { isMade, isAnError };

    using Clock = std::function<std::int64_t()>;

    /// The server in `folder`, in bytes, opened with the first request. Nothing fails before that. Only tests pass a
    /// `clock`, which counts seconds since 1970-01-01T00:00:00Z.
    explicit EmbeddedServer(std::string folder, Missing missing = Missing::isMade, Clock clock = systemTime);

    Expected<OdString> request(OdString const& verb, OdString const& document) override;
    WriteOutcome
    send(OdString const& repository, UploadName const& upload, std::uint64_t offset, std::string_view bytes) override;
    WriteOutcome receive(
        OdString const& repository, OdString const& record, std::uint64_t offset,
        std::function<bool(std::string_view)> const& sink) override;

private:
    struct Opened {
        Opened(std::string const& folder, Clock const& clock);

        SqliteHistory history;
        FolderContents contents;
        Parts parts;
        ServerCore core;
    };

    static std::int64_t systemTime();
    ServerCore& core();

    std::string folder_;
    Missing missing_;
    Clock clock_;
    std::unique_ptr<Opened> opened_;
};

} // namespace tav
