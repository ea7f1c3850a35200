/// Standing in for single calls of the operating system.
#pragma once

#include "platform/os/os_calls.h"

/// Remembers the table of calls and brings it back when it goes: a test changes entries of `os::calls()` meanwhile and
/// finds the real ones here.
class KeptCalls {
public:
    KeptCalls() { real = os::calls(); }
    KeptCalls(KeptCalls const&) = delete;
    KeptCalls& operator=(KeptCalls const&) = delete;
    ~KeptCalls() { os::calls() = real; }

    static inline os::Calls real{};
};
