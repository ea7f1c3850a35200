/// Which commit changed each file of a commit last.
#pragma once

#include "host/history/commit_tables.h"

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

struct LastChange {
    std::string path;        ///< as bytes
    std::int64_t commit = 0; ///< number, on the line of first parents
};

/// Reads the changes of all commits. A list that takes long is kept for the next time: the list of a later commit is
/// then made of it and of the changes since.
class LastChanges {
public:
    /// For the first repository in `database`, which lives longer.
    explicit LastChanges(Database& database) : database_(&database), commits_(database, kRepository) {}

    /// Makes the table in which a list is kept. Without it there is none.
    static void create(Database& database);

    /// The files of the commit in ascending order of bytes.
    std::vector<LastChange> at(CommitRecord const& commit);
    /// All commits, without their messages and parents.
    std::vector<CommitRecord> commits() const;

private:
    static constexpr std::int64_t kRepository = 1;

    struct Kept {
        std::int64_t commit = 0; ///< 0: there is none
        std::vector<LastChange> files;
    };

    Kept kept() const;
    void keep(std::int64_t commit, std::vector<LastChange> const& files);
    std::vector<LastChange> readAll(std::vector<std::int64_t> const& line) const;
    std::vector<LastChange> after(Kept kept, std::vector<std::int64_t> const& later) const;

    Database* database_;
    CommitTables commits_;
};

} // namespace tav
