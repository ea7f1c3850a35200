/// The calls of the operating system that this folder makes to change the disk, and those that an open file needs, in
/// one table.
#pragma once

#include "platform/mu_platform_export.h"

#include <cstddef>
#include <ctime>
#include <sys/types.h>

namespace os {

/// One entry per call, named after it and with its parameters: the result is -1 with `errno` set when it fails.
/// Every replacement, move and removal of a file, and every write to an open one, goes through this table, so that a
/// test can replace any call and make it fail. Exceptions are the library's log and `touch`,
/// because an editor's own platform has no such table, and what SQLite writes.
struct Calls {
    int (*openat)(int folder, char const* path, int flags, mode_t mode);
    ssize_t (*read)(int file, void* buffer, std::size_t count);
    ssize_t (*write)(int file, void const* bytes, std::size_t count);
    ssize_t (*pread)(int file, void* buffer, std::size_t count, off_t offset);
    ssize_t (*pwrite)(int file, void const* bytes, std::size_t count, off_t offset);
    int (*ftruncate)(int file, off_t length);
    int (*fsync)(int file);
    int (*syncfs)(int file);
    int (*close)(int file);
    int (*flock)(int file, int operation);
    int (*fchown)(int file, uid_t owner, gid_t group);
    int (*fchmod)(int file, mode_t mode);
    int (*fsetxattr)(int file, char const* name, void const* value, std::size_t size, int flags);
    int (*fremovexattr)(int file, char const* name);
    int (*linkat)(int fromFolder, char const* from, int toFolder, char const* to, int flags);
    int (*renameat)(int fromFolder, char const* from, int toFolder, char const* to);
    int (*renameat2)(int fromFolder, char const* from, int toFolder, char const* to, unsigned flags);
    int (*unlinkat)(int folder, char const* path, int flags);
    int (*mkdir)(char const* path, mode_t mode);
    int (*mkdirat)(int folder, char const* path, mode_t mode);
    int (*futimens)(int file, struct timespec const* times);
};

/// The process's table. Only tests change it, while no other thread uses it.
MU_PLATFORM_EXPORT Calls& calls() noexcept;

} // namespace os
