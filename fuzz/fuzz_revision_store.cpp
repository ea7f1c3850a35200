// A revision store or object of any bytes is listed and read, whole contents and deltas, without a wrong content: the
// digest of what was given out is the one of the header.
#include "common/mu_common_versions.h"

#include "host/storage/chain.h"
#include "host/storage/storage_error.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <sys/mman.h>
#include <unistd.h>

namespace {

constexpr std::uint64_t kLongest = std::uint64_t{1} << 22; // Bytes repeated a million times take a while.

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

// A file in memory that can be opened by its path.
class MemoryFile {
public:
    MemoryFile(void const* bytes, std::size_t size) : file_(memfd_create("store", MFD_CLOEXEC))
    {
        require(file_ != -1 && write(file_, bytes, size) == static_cast<ssize_t>(size));
    }
    MemoryFile(MemoryFile const&) = delete;
    MemoryFile& operator=(MemoryFile const&) = delete;
    ~MemoryFile() { close(file_); }

    std::string path() const { return "/proc/self/fd/" + std::to_string(file_); }

private:
    int file_;
};

void readRecord(std::shared_ptr<tav::RecordFile const> const& store, std::size_t index)
{
    common::ContentDigest digest;
    try {
        tav::ChainReader("/tmp").read({store, index}, tav::basesIn(store), [&](std::string_view piece) {
            digest.update(piece.data(), piece.size());
        });
    } catch (tav::StorageError const& error) {
        require(error.what == "The store is damaged.");
        return;
    }
    require(digest.finish().ansi_str() == tav::hexOf(store->entries()[index].record.digest));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const file(data, size);
    auto const store =
        std::make_shared<tav::RecordFile const>(tav::RecordFile::openForReading(file.path(), "The store"));
    require(store->length() == size && store->end() <= size);
    for (std::size_t i = 0; i < store->entries().size(); ++i) {
        tav::Entry const& entry = store->entries()[i];
        require(entry.end() <= size && store->find(entry.record.digest).has_value());
        if (entry.record.length <= kLongest) {
            readRecord(store, i);
        }
    }
    return 0;
}
