/// Making one request for memory fail, whoever makes it.
#pragma once

#include "tests/support/allocations.h"

namespace host_tests {

/// While it lives, requests for memory by SQLite and zstd count among those by `new`, and fail like them. Counting
/// begins with `FailingAllocation::resume`. One at a time, on one thread, and no database is open when it begins or
/// ends.
class FailingMemory {
public:
    FailingMemory(long n, support::FailingAllocation::Lasts lasts);
    FailingMemory(FailingMemory const&) = delete;
    FailingMemory& operator=(FailingMemory const&) = delete;
    ~FailingMemory();

private:
    support::FailingAllocation const failing_;
};

} // namespace host_tests
