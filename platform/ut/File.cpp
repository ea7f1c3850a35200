#include "platform/ut/File.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_files.h"

#include <sys/stat.h>

namespace ut {

File::~File()
{
    close();
}

bool File::open(OdString const& path, OpenMode /*mode*/)
{
    close();
    return !os::openForReading(path.ansi_str(), handle_);
}

std::uint64_t File::length() const
{
    struct stat status;
    return handle_ != -1 && fstat(handle_, &status) == 0 ? static_cast<std::uint64_t>(status.st_size) : 0;
}

std::size_t File::read(void* buffer, std::size_t count)
{
    std::size_t done = 0;
    if (handle_ != -1) {
        static_cast<void>(os::readBytes(handle_, buffer, count, done)); // What was read counts, whatever ended it.
    }
    return done;
}

void File::close()
{
    if (handle_ != -1) {
        os::calls().close(handle_);
        handle_ = -1;
    }
}

} // namespace ut
