/// The one owner of a file descriptor.
#pragma once

#include "platform/os/os_calls.h"

#include <utility>

namespace os {

/// An open file or folder; closes itself.
class Handle {
public:
    Handle() = default;
    explicit Handle(int file) : file_(file) {}
    Handle(Handle&& other) noexcept : file_(std::exchange(other.file_, -1)) {}
    Handle& operator=(Handle&& other) noexcept
    {
        std::swap(file_, other.file_);
        return *this;
    }
    // Interrupted or not, the system closes the file: a second call could hit another one.
    ~Handle()
    {
        if (file_ != -1) {
            calls().close(file_);
        }
    }

    bool isOpen() const { return file_ != -1; }
    /// The descriptor, still owned by this; -1 when nothing is open.
    int get() const { return file_; }
    /// The descriptor, owned by the caller from here on.
    int release() { return std::exchange(file_, -1); }

private:
    int file_ = -1;
};

} // namespace os
