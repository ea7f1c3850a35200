/// Making one call of the operating system fail.
#pragma once

#include <functional>
#include <string>

namespace support {

/// While it lives, stands in for the platform's calls of the operating system (`os::calls()`), counts them and makes
/// one of them fail. One at a time, and no other thread may write meanwhile.
class FailingCall {
public:
    /// In place of an error number: the call does not return, the process dies in it as by `kill -9`.
    static constexpr int kKillProcess = -1;

    enum class Lasts { once, on };

    /// The n-th call from here on, counted from 0, does nothing and fails with the error number `error`; all others
    /// work. (A `close` that fails has closed the file all the same, as the system does it.) With `Lasts::on` all later
    /// ones fail as well, or, when the disk is full (ENOSPC), from the n-th on those that need room there.
    FailingCall(int n, int error, Lasts lasts = Lasts::once);
    FailingCall(FailingCall const&) = delete;
    FailingCall& operator=(FailingCall const&) = delete;
    /// Brings the real calls back.
    ~FailingCall();

    /// Whether a call has failed.
    bool hasFailed() const;
    /// Which call failed first, for messages: "3: fsync"; "no call" before it has come.
    std::string name() const;
};

/// How many calls `operation` makes when all of them work.
int countCalls(std::function<void()> const& operation);

} // namespace support
