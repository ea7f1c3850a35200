/// Making one request for memory fail. A program that uses this gets its own `operator new`.
#pragma once

namespace host_tests {

/// Counts the requests for memory by `operator new` and by SQLite, and lets the n-th of them, counted from 0, fail;
/// with `Lasts::on` all later ones as well. One at a time, on one thread, and no database is open when it begins or
/// ends.
class FailingAllocation {
public:
    enum class Lasts { once, on };

    explicit FailingAllocation(long n, Lasts lasts = Lasts::once);
    FailingAllocation(FailingAllocation const&) = delete;
    FailingAllocation& operator=(FailingAllocation const&) = delete;
    ~FailingAllocation();

    /// Counts from here on; does nothing when that has begun.
    static void begin();
    /// From here on there is memory again.
    static void end();
    /// Whether the n-th request has come.
    static bool hasFailed();
};

} // namespace host_tests
