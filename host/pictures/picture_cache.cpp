#include "host/pictures/picture_cache.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <algorithm>
#include <atomic>
#include <unistd.h>
#include <utility>
#include <vector>
#include <zlib.h>

namespace tav {

namespace {

// A digest begins with any of sixteen digits. Each has a folder and its share of the limit, so that making room looks
// at a sixteenth of the pictures.
constexpr std::uint64_t kParts = 16;
constexpr std::size_t kDigestSize = 64;
constexpr std::string_view kEnding = ".picture";
constexpr std::string_view kUnfinished = ".tmp";
constexpr std::string_view kBegin = "tav picture 1\n"; ///< a checksum and the PNG follow
constexpr std::size_t kHeadSize = kBegin.size() + 4;

bool isDigest(std::string_view text)
{
    return text.size() == kDigestSize && text.find_first_not_of("0123456789abcdef") == std::string_view::npos;
}

// The name of a picture, or of one that a killed process did not finish.
bool isOurs(std::string_view name)
{
    std::string_view const end = name.substr(std::min(name.size(), kDigestSize));
    bool const isUnfinished =
        end.size() > kUnfinished.size() && end.substr(end.size() - kUnfinished.size()) == kUnfinished;
    return isDigest(name.substr(0, kDigestSize)) && (end == kEnding || isUnfinished);
}

std::string checksumOf(std::string_view png)
{
    uLong const sum = crc32_z(0, reinterpret_cast<Bytef const*>(png.data()), png.size());
    std::string bytes;
    for (unsigned shift = 0; shift < 32; shift += 8) {
        bytes += static_cast<char>(sum >> shift & 0xFFU);
    }
    return bytes;
}

struct File {
    std::int64_t modified;
    std::uint64_t size;
    std::string path;

    bool operator<(File const& other) const { return modified < other.modified; }
};

// What a file of so many bytes takes on the disk: an empty picture is not free either.
std::uint64_t sizeOnDisk(std::uint64_t bytes)
{
    constexpr std::uint64_t kBlock = 4096;
    return (bytes + kBlock - 1) / kBlock * kBlock;
}

std::vector<File> filesIn(std::string const& folder)
{
    std::vector<File> files;
    os::FolderReader const reader = os::openFolder(folder);
    while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
        std::string const path = folder + "/" + entry->d_name;
        struct statx status = {};
        if (isOurs(entry->d_name) && !os::examine(path, status)) {
            std::int64_t const modified = status.stx_mtime.tv_sec * 1'000'000'000 + status.stx_mtime.tv_nsec;
            files.push_back({modified, sizeOnDisk(status.stx_size), path});
        }
    }
    return files;
}

// A name that no other process or thread takes.
std::string unfinishedPath(std::string const& folder, std::string const& digest)
{
    static std::atomic<unsigned> counter = 0;
    return folder + "/" + digest + "-" + std::to_string(getpid()) + "-" + std::to_string(counter++) +
           std::string(kUnfinished);
}

std::error_code writeNew(std::string const& path, std::string_view content)
{
    os::OpenFile file;
    if (std::error_code const error = file.create(path, 0600)) {
        return error;
    }
    return file.writeAt(0, content);
}

} // namespace

PictureCache::PictureCache(std::string folder, std::uint64_t maxBytes)
    : folder_(std::move(folder))
    , maxBytesOfPart_(maxBytes / kParts)
{
}

std::string PictureCache::folderOf(std::string const& digest) const
{
    return folder_ + "/" + digest[0];
}

std::optional<std::string> PictureCache::find(std::string const& digest) const
{
    if (!isDigest(digest)) {
        return std::nullopt;
    }
    std::string const path = folderOf(digest) + "/" + digest + std::string(kEnding);
    struct statx status = {};
    std::string content;
    if (os::examine(path, status) || status.stx_size > maxBytesOfPart_ || os::readFile(path, content)) {
        return std::nullopt;
    }
    std::string png = content.substr(std::min(content.size(), kHeadSize));
    bool const isWhole = content.substr(0, kHeadSize) == std::string(kBegin) + checksumOf(png);
    return isWhole ? std::optional(std::move(png)) : std::nullopt;
}

// Not flushed: after a crash of the machine a picture can be cut off, and its checksum says so.
void PictureCache::keep(std::string const& digest, std::string_view png) const
{
    if (!isDigest(digest) || png.size() + kHeadSize > maxBytesOfPart_) {
        return;
    }
    std::string const folder = folderOf(digest);
    if (os::makeFolders(folder, 0700)) {
        return;
    }
    makeRoom(folder, sizeOnDisk(png.size() + kHeadSize));
    std::string const unfinished = unfinishedPath(folder, digest);
    std::error_code error = writeNew(unfinished, std::string(kBegin) + checksumOf(png) + std::string(png));
    if (!error) {
        error = os::renameUnflushed(unfinished, folder + "/" + digest + std::string(kEnding));
    }
    if (error) {
        static_cast<void>(os::removeUnflushed(unfinished));
    }
}

void PictureCache::makeRoom(std::string const& folder, std::uint64_t bytes) const
{
    std::vector<File> files = filesIn(folder);
    std::uint64_t total = bytes;
    for (File const& file : files) {
        total += file.size;
    }
    if (total <= maxBytesOfPart_) {
        return;
    }
    std::sort(files.begin(), files.end());
    for (File const& file : files) {
        if (total <= maxBytesOfPart_) {
            return;
        }
        static_cast<void>(os::removeUnflushed(file.path));
        total -= file.size;
    }
}

} // namespace tav
