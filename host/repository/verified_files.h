/// Working files that were read, as a table of the local database: the digest of each, and its stamp at that time.
///
/// A record describes a file, not a commit. So it is valid whichever commit is checked out, and may be written at any
/// time after the file was read.
#pragma once

#include "host/database/sqlite.h"
#include "host/repository/file_stamp.h"
#include "host/text/digest.h"

#include <string>
#include <vector>

namespace tav {

struct VerifiedFile {
    std::string path; ///< in bytes: it is never shown
    Digest digest{};
    FileStamp stamp;
};

/// Each path once, in ascending order of bytes.
using VerifiedFileList = std::vector<VerifiedFile>;

/// One thread. Every operation throws `Failure` when the database cannot be used.
class VerifiedFiles {
public:
    /// The table in `database`, which must outlive this object.
    explicit VerifiedFiles(Database& database) : database_(&database) {}

    /// Makes the table in a database without it.
    static void create(Database& database);

    VerifiedFileList all() const;
    /// Adds `files`, replacing records of the same paths. Part of a `WriteTransaction` of the caller.
    void put(VerifiedFileList const& files);

private:
    Database* database_;
};

} // namespace tav
