#include "host/database/sqlite.h"

#include "host/errors/failure.h"

#include <sqlite3.h>

#include <cerrno>
#include <utility>

namespace tav {

namespace {

// "psow=0": a power failure may damage whatever is in the sector that is being written. Several pages fit into one, and
// the journal then keeps all of them.
std::string addressOf(std::string const& path)
{
    constexpr std::string_view kHexDigits = "0123456789abcdef";
    std::string address = path.front() == '/' ? "file://" : "file:";
    for (char const c : path) {
        auto const byte = static_cast<unsigned char>(c);
        bool const isSpecial = c == '%' || c == '?' || c == '#';
        address += isSpecial ? std::string{'%', kHexDigits[byte / 16U], kHexDigits[byte % 16U]} : std::string(1, c);
    }
    return address + "?psow=0";
}

sqlite3* opened(std::string const& path, int flags, int& code)
{
    sqlite3* handle = nullptr;
    code = sqlite3_open_v2(addressOf(path).c_str(), &handle, flags | SQLITE_OPEN_URI, nullptr);
    return handle;
}

/// What a caller may want to tell apart, as the system calls it.
std::int32_t systemCodeOf(int code)
{
    switch (code & 0xFF) {
    case SQLITE_BUSY:
    case SQLITE_LOCKED: return EBUSY;
    case SQLITE_FULL: return ENOSPC;
    default: return 0;
    }
}

} // namespace

Statement::Statement(Database const& database, Handle handle) : database_(&database), handle_(std::move(handle)) {}

Statement& Statement::with(std::int64_t value)
{
    int const code = sqlite3_bind_int64(handle_.get(), ++parameters_, value);
    if (code != SQLITE_OK) {
        database_->fail(code);
    }
    return *this;
}

Statement& Statement::with(OdString const& text)
{
    return with(std::string_view(text.ansi_str()));
}

Statement& Statement::with(std::string_view bytes)
{
    int const code =
        sqlite3_bind_text64(handle_.get(), ++parameters_, bytes.data(), bytes.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
    if (code != SQLITE_OK) {
        database_->fail(code);
    }
    return *this;
}

bool Statement::next()
{
    int const code = sqlite3_step(handle_.get());
    if (code == SQLITE_ROW) {
        return true;
    }
    reset();
    if (code != SQLITE_DONE) {
        database_->fail(code);
    }
    return false;
}

void Statement::run()
{
    while (next()) {
    }
}

void Statement::reset()
{
    sqlite3_reset(handle_.get());
    parameters_ = 0;
}

std::int64_t Statement::integer(int column) const
{
    return sqlite3_column_int64(handle_.get(), column);
}

std::string_view Statement::bytes(int column) const
{
    auto const* const bytes = reinterpret_cast<char const*>(sqlite3_column_text(handle_.get(), column));
    auto const length = static_cast<std::size_t>(sqlite3_column_bytes(handle_.get(), column));
    return bytes ? std::string_view(bytes, length) : std::string_view();
}

OdString Statement::text(int column) const
{
    std::string_view const text = bytes(column);
    return {text.data(), text.size(), CP_UTF_8};
}

Database::Database(std::string const& path, std::chrono::milliseconds patience)
    : Database(path, "Put a copy of it from a backup in its place.", patience)
{
}

Database::Database(std::string const& path, char const* adviceForDamage, std::chrono::milliseconds patience)
    : path_(path)
    , adviceForDamage_(adviceForDamage)
    , handle_(nullptr, sqlite3_close_v2)
{
    constexpr int kOneThread = SQLITE_OPEN_NOMUTEX; // Locks took a tenth of the time of reading a long table.
    int code = SQLITE_OK;
    handle_.reset(opened(path, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | kOneThread, code));
    if (code == SQLITE_CANTOPEN) {
        handle_.reset(opened(path, SQLITE_OPEN_READONLY | kOneThread, code));
    }
    if (code != SQLITE_OK) {
        fail(code);
    }
    sqlite3_busy_timeout(handle_.get(), static_cast<int>(patience.count()));
    distrustSchema();
    // A new file gets small pages: there are two dozen tables and indexes, and most of a small project are almost
    // empty. EXTRA: a journal that comes back after a power failure would undo a change that others rely on already.
    run("PRAGMA page_size = 2048; PRAGMA foreign_keys = ON; PRAGMA synchronous = EXTRA;");
}

// The file travels with the repository: nothing that a stranger put into its schema is run.
void Database::distrustSchema()
{
    for (int const option :
         {SQLITE_DBCONFIG_ENABLE_TRIGGER, SQLITE_DBCONFIG_ENABLE_VIEW, SQLITE_DBCONFIG_TRUSTED_SCHEMA}) {
        sqlite3_db_config(handle_.get(), option, 0, nullptr);
    }
    sqlite3_db_config(handle_.get(), SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
}

void Database::run(char const* statements)
{
    int const code = sqlite3_exec(handle_.get(), statements, nullptr, nullptr, nullptr);
    if (code != SQLITE_OK) {
        fail(code);
    }
}

Statement Database::prepare(char const* statement) const
{
    sqlite3_stmt* handle = nullptr;
    int const code = sqlite3_prepare_v2(handle_.get(), statement, -1, &handle, nullptr);
    if (code != SQLITE_OK) {
        fail(code);
    }
    return Statement(*this, Statement::Handle(handle, sqlite3_finalize));
}

std::int64_t Database::version() const
{
    Statement version = prepare("PRAGMA user_version");
    return version.next() ? version.integer(0) : 0;
}

void Database::setVersion(std::int64_t version)
{
    run(("PRAGMA user_version = " + std::to_string(version)).c_str());
}

std::string Database::damage() const
{
    Statement check = prepare("PRAGMA integrity_check(1)");
    std::string const found = check.next() ? check.text(0).ansi_str() : "no answer";
    return found == "ok" ? std::string() : found;
}

std::string Database::adviceFor(int code) const
{
    switch (code & 0xFF) {
    case SQLITE_BUSY:
    case SQLITE_LOCKED: return "Another program uses it; run the command again when that is done.";
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB: return adviceForDamage_;
    case SQLITE_FULL: return "Free some space there and run the command again; nothing has changed.";
    default: return "Check the free space and your rights in the folder of '" + path_ + "'.";
    }
}

void Database::fail(int code) const
{
    Failure failure("The database '" + path_ + "' cannot be used: " + sqlite3_errstr(code) + ".", adviceFor(code));
    failure.code = systemCodeOf(code);
    throw failure;
}

// A savepoint, unlike a transaction, may stand inside of a change.
ReadTransaction::ReadTransaction(Database& database) : database_(database)
{
    database_.run("SAVEPOINT reading");
}

ReadTransaction::~ReadTransaction()
{
    try {
        database_.run("RELEASE reading");
    } catch (...) {
        // There may be no memory even for the message. Closing the database ends it as well.
    }
}

WriteTransaction::WriteTransaction(Database& database) : database_(database)
{
    database_.run("BEGIN IMMEDIATE");
}

WriteTransaction::~WriteTransaction()
{
    if (!isOpen_) {
        return;
    }
    try {
        database_.run("ROLLBACK");
    } catch (...) {
        // There may be no memory even for the message. The journal undoes the change when the database is opened next.
    }
}

void WriteTransaction::commit()
{
    database_.run("COMMIT");
    isOpen_ = false;
}

} // namespace tav
