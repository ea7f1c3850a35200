/// Seeing the calls of the system that SQLite makes.
#pragma once

namespace host_tests {

/// While it lives, SQLite opens, reads, writes, flushes and removes files through `os::calls()`: whoever stands in for
/// those calls sees the writes of a whole command, in their order. One at a time.
class SqliteCalls {
public:
    SqliteCalls();
    SqliteCalls(SqliteCalls const&) = delete;
    SqliteCalls& operator=(SqliteCalls const&) = delete;
    ~SqliteCalls();
};

} // namespace host_tests
