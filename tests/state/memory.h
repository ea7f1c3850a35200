/// The memory of the test program that has this among its sources: how much is in use, and running out of it.
#pragma once

#include <cstddef>

namespace states {

/// While it lives, the most bytes that were in use at once, beyond those at its beginning.
class PeakOfMemory {
public:
    PeakOfMemory();
    PeakOfMemory(PeakOfMemory const&) = delete;
    PeakOfMemory& operator=(PeakOfMemory const&) = delete;

    std::size_t bytes() const;

private:
    std::size_t before_;
};

/// While it lives, the n-th demand for memory from here on, counted from 0, fails; those before and after it do not.
/// One at a time.
class FailingDemand {
public:
    explicit FailingDemand(long n);
    FailingDemand(FailingDemand const&) = delete;
    FailingDemand& operator=(FailingDemand const&) = delete;
    ~FailingDemand();

    /// Whether the n-th demand has come.
    static bool hasFailed();
    /// No demand fails any more.
    static void stop();
};

} // namespace states
