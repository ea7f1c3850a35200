#include "platform/os/os_calls.h"

#include <cstdio>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

namespace os {
namespace {

// The C library declares this one with a variable number of arguments.
int openAt(int folder, char const* path, int flags, mode_t mode)
{
    return ::openat(folder, path, flags, mode);
}

} // namespace

Calls& calls() noexcept
{
    static Calls table{openAt,   ::read,     ::write,     ::pread,    ::pwrite, ::ftruncate, ::fsync,
                       ::syncfs, ::close,    ::flock,     ::fchown,   ::fchmod, ::fsetxattr, ::fremovexattr,
                       ::linkat, ::renameat, ::renameat2, ::unlinkat, ::mkdir,  ::mkdirat,   ::futimens};
    return table;
}

} // namespace os
