/// Which contents a server has, and which are on their way, as tables of a database.
///
/// One thread. Every operation throws `Failure` when the database cannot be used; those that change something are part
/// of a `WriteTransaction` of the caller.
#pragma once

#include "host/database/sqlite.h"
#include "host/server/history_store.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

class ContentTables {
public:
    /// The tables of the repository `repository` in `database`, which lives longer.
    ContentTables(Database& database, std::int64_t repository) : database_(&database), repository_(repository) {}

    /// Makes the tables. All contents that commits name up to now are awaited.
    static void create(Database& database);

    // What `HistorySnapshot` and `HistoryTransaction` say of these:
    std::optional<StoredContent> content(Digest const& digest) const;
    std::optional<StoredContent> contentOfRecord(Digest const& record) const;
    std::vector<StoredContent> unneeded(std::int64_t now, std::size_t most) const;
    bool isAwaited(Digest const& digest) const;
    std::optional<Upload> upload(std::int64_t id) const;
    std::optional<Upload> upload(OdString const& folder, Digest const& record) const;
    std::vector<Upload> uploadsBefore(std::int64_t time) const;
    bool isUsed(std::int64_t id) const;

    void set(StoredContent const& content);
    void removeContent(Digest const& digest);
    void lease(std::vector<Digest> const& contents, std::int64_t time);
    std::vector<Digest> name(std::vector<Digest> const& contents);
    void await(std::vector<Digest> const& contents);
    void removeAwaited(Digest const& digest);
    std::int64_t add(Upload const& upload);
    void touch(std::int64_t upload, std::int64_t now);
    void removeUpload(std::int64_t id);

    /// Whether any repository in `database` has an upload of that number.
    static bool hasUpload(Database const& database, std::int64_t id);

private:
    Statement prepare(std::string const& statement) const;

    Database* database_;
    std::int64_t repository_;
};

} // namespace tav
