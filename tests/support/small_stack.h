/// Running a part of a test on a small call stack.
#pragma once

#include <functional>

namespace support {

/// Runs `body` on a thread of its own whose stack has 256 KiB, and waits for it. Under the address sanitizer, whose
/// frames are several times as large, the stack is 1 MiB.
void onSmallStack(std::function<void()> const& body);

} // namespace support
