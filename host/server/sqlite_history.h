/// History in a file of SQLite.
#pragma once

#include "host/database/sqlite.h"
#include "host/server/history_store.h"

#include <memory>
#include <string>
#include <vector>

namespace tav {

/// Several processes, also on several machines, may use one file: changes exclude each other.
///
/// The tables of an earlier tav are read as they are, and get their present form with the first change: who only reads
/// a server may not be allowed to change it.
class SqliteHistory final : public HistoryStore {
public:
    /// Opens the file `path`, in bytes, or makes it. Its folder must exist.
    explicit SqliteHistory(std::string const& path);

    std::vector<Repository> repositories() override;
    std::optional<Repository> find(OdString const& id) override;
    bool add(Repository const& repository) override;
    std::unique_ptr<HistorySnapshot> read(OdString const& id) override;
    std::unique_ptr<HistoryTransaction> write(OdString const& id) override;
    bool hasUpload(std::int64_t id) override;
    void noteDelivered(OdString const& id, std::int64_t number) override;

private:
    std::int64_t keyOf(OdString const& id) const;

    Database database_;
};

} // namespace tav
