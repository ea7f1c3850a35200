/// Unfinished work that has been put aside, as tables of the database of a working folder.
///
/// A shelf is no commit: it is in this folder only. It is there unless the command that made it has been undone, and
/// until a command takes it that has not been undone: the log of operations says so, and undoing needs no more here.
/// All that changes is part of a `WriteTransaction` of the caller. One thread. Every operation throws `Failure` when
/// the database cannot be used.
#pragma once

#include "host/database/sqlite.h"

#include "common/mu_common_state.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

/// A file of a shelf: URLs of its contents. Empty: no file.
struct ShelvedFile {
    OdString path;
    OdString base;    ///< what the commit had
    OdString content; ///< what the working folder had
    std::uint32_t permissions = 0;
};

struct Shelf {
    std::int64_t id = 0;
    std::int64_t date = 0; ///< seconds since 1970-01-01T00:00:00Z
    OdString message;
    OdString commit; ///< hash of the commit that the folder stood on
    OdString branch;
    std::size_t fileCount = 0;
    std::vector<ShelvedFile> files;
    common::State staging; ///< what was staged, without the index
};

class Shelves {
public:
    /// The tables in `database`, which lives longer.
    explicit Shelves(Database& database) : database_(&database) {}

    /// Makes the tables in a database without them.
    static void create(Database& database);

    /// Adds a shelf with the present date, made by this operation, and returns its number.
    std::int64_t add(Shelf const& shelf, std::int64_t operation);
    /// The operation has taken the shelf.
    void take(std::int64_t id, std::int64_t operation);

    /// Those that are there, the newest first, without files and staging.
    std::vector<Shelf> all() const;
    /// Reads the files and the staging of a shelf.
    void readDetails(Shelf& shelf) const;

    /// The URLs of the contents of all shelves, those included that undoing may bring back.
    std::vector<OdString> urls() const;
    /// The path of a file that has the content at `url`; empty when there is none.
    OdString pathAt(OdString const& url) const;

    /// The operation is about to be forgotten for good: what it has made or taken stays so.
    static void forget(std::int64_t operation, Database& database);

private:
    Database* database_;
};

} // namespace tav
