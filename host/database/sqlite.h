/// Databases of one file each, kept with SQLite.
///
/// Working folders lie on network drives, where a write-ahead log does not work: a database has a rollback journal and
/// waits for the disk at every commit. Every operation throws `Failure` when the database cannot be used. One thread.
#pragma once

#include "platform/sdk/OdString.h"

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

namespace tav {

class Database;

/// A statement with its parameters and its current row. The database must outlive it.
class Statement {
public:
    /// Sets the next parameter, in the order of the statement.
    Statement& with(std::int64_t value);
    Statement& with(OdString const& text);
    Statement& with(std::string_view bytes); ///< of a text

    /// Goes to the next row; false after the last. The statement can then be given new parameters and run again.
    bool next();
    /// Runs a statement that has no rows.
    void run();
    /// Leaves the current row; while a statement has one, other programs cannot change the file.
    void reset();

    /// Columns of the row, counted from 0. A null is 0, and an empty text.
    std::int64_t integer(int column) const;
    OdString text(int column) const;
    std::string_view bytes(int column) const; ///< of a text; valid until the next row is asked for

private:
    friend class Database;
    using Handle = std::unique_ptr<sqlite3_stmt, int (*)(sqlite3_stmt*)>;

    Statement(Database const& database, Handle handle);

    Database const* database_;
    Handle handle_;
    int parameters_ = 0;
};

class Database {
public:
    static constexpr std::chrono::milliseconds kPatience{5000};

    /// Opens the file `path`, in bytes, making it when it is missing; its folder must exist. Where the file may not be
    /// written it is opened for reading. Triggers and views of the file are not run. While another program holds the
    /// file an operation waits up to `patience`.
    explicit Database(std::string const& path, std::chrono::milliseconds patience = kPatience);
    /// The same, with the advice for a damaged file, a sentence.
    Database(std::string const& path, char const* adviceForDamage, std::chrono::milliseconds patience = kPatience);

    std::string const& path() const { return path_; }

    /// Runs statements without parameters.
    void run(char const* statements);
    Statement prepare(char const* statement) const;

    /// The version of the tables, which the file itself keeps; 0 for a new file.
    std::int64_t version() const;
    void setVersion(std::int64_t version);

    /// What SQLite finds wrong with the file; empty when it is whole.
    std::string damage() const;

    [[noreturn]] void fail(int code) const;

private:
    void distrustSchema();
    std::string adviceFor(int code) const;

    std::string path_;
    char const* adviceForDamage_;
    std::unique_ptr<sqlite3, int (*)(sqlite3*)> handle_;
};

/// While it lives everything that is read is of one moment, whatever others change meanwhile. Other programs have to
/// wait with their changes, so it is not held for long.
class ReadTransaction {
public:
    explicit ReadTransaction(Database& database);
    ReadTransaction(ReadTransaction const&) = delete;
    ReadTransaction& operator=(ReadTransaction const&) = delete;
    ~ReadTransaction();

private:
    Database& database_;
};

/// Makes changes one: all of them are in the file when `commit` returns, and none when it is not called or a crash
/// comes first. Others wait until the change is over.
class WriteTransaction {
public:
    explicit WriteTransaction(Database& database);
    WriteTransaction(WriteTransaction const&) = delete;
    WriteTransaction& operator=(WriteTransaction const&) = delete;
    ~WriteTransaction();

    void commit();

private:
    Database& database_;
    bool isOpen_ = true;
};

} // namespace tav
