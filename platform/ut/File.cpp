#include "platform/ut/File.h"

#include "platform/os/os_files.h"

#include <sys/stat.h>

namespace ut {

struct File::Open {
    os::Handle handle;
};

File::File() noexcept = default;

File::~File() = default;

bool File::open(OdString const& path, OpenMode /*mode*/)
{
    close();
    auto opened = std::make_unique<Open>();
    if (os::openForReading(path.ansi_str(), opened->handle)) {
        return false;
    }
    open_ = std::move(opened);
    return true;
}

std::uint64_t File::length() const
{
    struct stat status;
    return open_ && fstat(open_->handle.get(), &status) == 0 ? static_cast<std::uint64_t>(status.st_size) : 0;
}

std::size_t File::read(void* buffer, std::size_t count)
{
    std::size_t done = 0;
    if (open_) { // What was read counts, whatever ended it.
        static_cast<void>(os::readBytes(open_->handle, buffer, count, done));
    }
    return done;
}

void File::close()
{
    open_.reset();
}

} // namespace ut
