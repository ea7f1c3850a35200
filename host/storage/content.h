/// Contents, in memory or in a file, as the storage processes them.
#pragma once

#include "platform/os/os_open_file.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

namespace tav {

/// Memory that grows and is not initialised: pages that are never written cost nothing.
class Buffer {
public:
    Buffer() = default;
    Buffer(Buffer&& other) noexcept : bytes_(std::move(other.bytes_)), size_(std::exchange(other.size_, 0)) {}
    Buffer& operator=(Buffer&& other) noexcept
    {
        bytes_ = std::move(other.bytes_);
        size_ = std::exchange(other.size_, 0);
        return *this;
    }
    ~Buffer() = default;

    /// At least `size` bytes, valid until the next call. Their content is lost when they have to grow.
    /// Throws `std::bad_alloc`.
    char* reserve(std::size_t size);
    /// The bytes last reserved; null when there are none yet.
    char* data() const { return bytes_.get(); }

private:
    struct Free {
        void operator()(char* bytes) const { std::free(bytes); }
    };

    std::unique_ptr<char, Free> bytes_;
    std::size_t size_ = 0;
};

/// Bytes that can be read at any place, in memory or in an open file.
class Content {
public:
    /// Empty, in memory.
    Content() = default;
    /// `length` bytes in memory.
    Content(Buffer bytes, std::size_t length) : bytes_(std::move(bytes)), length_(length) {}
    /// The first `length` bytes of `file`; errors call it `name`.
    Content(os::OpenFile file, std::uint64_t length, std::string name);

    std::uint64_t length() const { return length_; }
    bool isInMemory() const { return !file_.isOpen(); }
    /// Releases the memory of the content for other use; the content is lost.
    Buffer takeMemory() { return std::move(bytes_); }

    /// The `count` bytes at `offset`, which must be inside. Valid as long as the content and until `buffer`, which
    /// they are read into unless they are in memory, is used again. Throws `StorageError` when they cannot be read,
    /// or when the file has become shorter.
    std::string_view at(std::uint64_t offset, std::size_t count, Buffer& buffer) const;

private:
    Buffer bytes_;
    os::OpenFile file_;
    std::uint64_t length_ = 0;
    std::string name_;
};

} // namespace tav
