/// What a working folder knows of its history: the database "tav.db" in ".tav".
#pragma once

#include "host/history/commit_tables.h"
#include "host/repository/operations.h"
#include "host/repository/shelves.h"
#include "host/repository/verified_files.h"

#include "common/mu_common_repo_prop.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

/// One thread at a time. Every operation throws `Failure` when the database cannot be used; opening also throws when it
/// is missing although contents are stored.
class LocalDatabase {
public:
    /// Opens the database, and makes it when it is missing. A database of an earlier tav is migrated. The caller holds
    /// the lock of the repository.
    static LocalDatabase make(common::RootPath const& root);
    /// The same for the file `path`, in bytes, whether or not contents are stored beside it.
    static LocalDatabase makeAt(std::string const& path);
    /// Like `make`, but when the database is missing, a temporary empty one is used instead.
    static LocalDatabase openForChanges(common::RootPath const& root);
    /// For commands that only read: a database of an earlier tav is not migrated.
    static LocalDatabase open(common::RootPath const& root);

    /// Whether it is missing or empty although contents are stored: a new one would hide the history.
    static bool isLost(common::RootPath const& root);

    LocalDatabase(LocalDatabase const&) = delete;
    LocalDatabase& operator=(LocalDatabase const&) = delete;

    std::string const& path() const { return database_.path(); }
    void failIfDamaged() const; ///< Throws `Failure` unless the whole file can be read.
    Database& database() { return database_; }
    CommitTables& commits() { return commits_; }
    CommitTables const& commits() const { return commits_; }

    /// What is known of working files without reading them.
    VerifiedFileList verifiedFiles() const;
    void addVerified(VerifiedFileList const& files); ///< part of a `WriteTransaction` of the caller

    /// Where the history is kept, and under which identifier; empty before `tav init` has found out.
    OdString serverFolder() const { return value("server"); }
    OdString repositoryId() const { return value("repository"); }
    void setServer(OdString const& folder, OdString const& repositoryId);

    /// Hash of the commit that the working folder is at; empty before the first commit.
    OdString currentCommit() const { return value("base"); }
    void setCurrentCommit(OdString const& hash) { setValue("base", hash); }

    /// The number of the commit up to which objects were turned over into differences; 0 when none were.
    std::int64_t turnedOver() const;
    void setTurnedOver(std::int64_t commit);

    /// Whether there is a log of operations: databases of earlier versions have none.
    bool hasOperations() const;
    Operations& operations() { return operations_; }
    Operations const& operations() const { return operations_; }
    /// Whether work can have been put aside: databases of earlier versions have no place for it.
    bool hasShelves() const;
    Shelves& shelves() { return shelves_; }
    Shelves const& shelves() const { return shelves_; }
    /// The pending operation, also of a database that an earlier version made.
    PendingOperation pendingOperation() const;

    /// URL of a content with this digest that is stored here, preferably in a revision store; empty when none is known.
    OdString urlOf(Digest const& digest) const;
    /// URL under which any commit has a content with this digest; empty when none has.
    OdString committedUrlOf(Digest const& digest) const;
    /// The URLs of all contents that were added, in ascending order: they are kept in this folder.
    std::vector<OdString> contents() const;
    /// Bytes of the content at `url`.
    std::optional<std::uint64_t> sizeOf(OdString const& url) const;
    void addContent(OdString const& url, Digest const& digest, std::uint64_t size);

private:
    enum class Use { reading, changing };

    /// Throws `Failure` when the database belongs to another repository than `folder`, unless that is null.
    LocalDatabase(std::string const& path, Use use, common::RootPath const* folder);

    void migrate();
    OdString value(char const* key) const;
    void setValue(char const* key, OdString const& value);

    Database database_;
    CommitTables commits_;
    VerifiedFiles verifiedFiles_;
    Operations operations_;
    Shelves shelves_;
};

} // namespace tav
