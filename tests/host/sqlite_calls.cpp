#include "tests/host/sqlite_calls.h"

#include "platform/os/os_calls.h"

#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

namespace host_tests {
namespace {

bool isWatched = false;

int openFile(char const* path, int flags, int mode)
{
    return os::calls().openat(AT_FDCWD, path, flags, static_cast<mode_t>(mode));
}

int closeFile(int file)
{
    return os::calls().close(file);
}

ssize_t readFile(int file, void* buffer, std::size_t count)
{
    return os::calls().read(file, buffer, count);
}

ssize_t writeFile(int file, void const* bytes, std::size_t count)
{
    return os::calls().write(file, bytes, count);
}

ssize_t readAt(int file, void* buffer, std::size_t count, off_t offset)
{
    return os::calls().pread(file, buffer, count, offset);
}

ssize_t writeAt(int file, void const* bytes, std::size_t count, off_t offset)
{
    return os::calls().pwrite(file, bytes, count, offset);
}

int truncateFile(int file, off_t length)
{
    return os::calls().ftruncate(file, length);
}

int removeFile(char const* path)
{
    return os::calls().unlinkat(AT_FDCWD, path, 0);
}

int changeMode(int file, mode_t mode)
{
    return os::calls().fchmod(file, mode);
}

sqlite3_vfs& fileSystem()
{
    sqlite3_vfs* const found = sqlite3_vfs_find("unix");
    if (found == nullptr) {
        std::fputs("SqliteCalls: no file system named \"unix\"\n", stderr);
        std::abort();
    }
    return *found;
}

/// Calls that this SQLite does not know are not made by it.
template <class Call>
void replace(char const* name, Call* call)
{
    fileSystem().xSetSystemCall(&fileSystem(), name, reinterpret_cast<sqlite3_syscall_ptr>(call));
}

} // namespace

SqliteCalls::SqliteCalls()
{
    replace("open", openFile);
    replace("close", closeFile);
    replace("read", readFile);
    replace("write", writeFile);
    replace("pread", readAt);
    replace("pread64", readAt);
    replace("pwrite", writeAt);
    replace("pwrite64", writeAt);
    replace("ftruncate", truncateFile);
    replace("unlink", removeFile);
    replace("fchmod", changeMode);
    isWatched = true;
}

SqliteCalls::~SqliteCalls()
{
    isWatched = false;
    fileSystem().xSetSystemCall(&fileSystem(), nullptr, nullptr); // All of them are the system's own again.
}

} // namespace host_tests

/// The one call that SQLite does not let go through its table. The program's own function comes before that of the C
/// library.
extern "C" __attribute__((visibility("default"))) int fdatasync(int file)
{
    return host_tests::isWatched ? os::calls().fsync(file) : fsync(file);
}
