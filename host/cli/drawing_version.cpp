#include "host/cli/drawing_version.h"

#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/pictures/drawing_picture.h"
#include "host/pictures/picture_cache.h"
#include "host/pictures/png_file.h"
#include "host/pictures/scaling.h"
#include "host/pictures/terminal.h"
#include "host/repository/names.h"
#include "host/storage/local_storage.h"
#include "host/user/user_folders.h"

#include "common/mu_common_repo_files.h"
#include "platform/os/os_files.h"

#include <array>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <string_view>
#include <unistd.h>
#include <utility>
#include <vector>

namespace tav {

namespace {

constexpr std::uint64_t kLongestDrawing = std::uint64_t{1} << 29; // It is held in memory.
constexpr std::uint64_t kCacheSize = std::uint64_t{1} << 28;
constexpr std::uint64_t kMostPixels = std::uint64_t{1} << 24;
constexpr std::uint32_t kWidthInTerminal = 480;
constexpr std::uint32_t kHeightInTerminal = 320;
constexpr std::string_view kPngSignature = "\x89PNG\r\n\x1a\n";

Image pictureOrFail(DrawingPicture found, std::string const& label)
{
    if (!found.image) {
        throw Failure("'" + label + "' has no picture to show. " + found.reason, "Its editor may be able to save one.");
    }
    return std::move(*found.image);
}

void failIfTooLong(std::uint64_t length, std::string const& label)
{
    if (length > kLongestDrawing) {
        throw Failure("'" + label + "' is longer than 512 MB.", "Longer files are not searched for a picture.");
    }
}

std::string contentInFolder(common::RootPath const& root, OdString const& path)
{
    std::string const file = root.pathTo(path).ansi_str();
    std::error_code unknown;
    std::uintmax_t const length = std::filesystem::file_size(file, unknown);
    failIfTooLong(unknown ? 0 : length, shown(path));
    std::string content;
    if (std::error_code const error = os::readFile(file, content)) {
        throw Failure("'" + shown(path) + "' cannot be read: " + error.message() + ".", "Check the name.");
    }
    return content;
}

std::string contentOf(common::RootPath const& root, OdString const& url, std::string const& label)
{
    LocalStorage storage(root);
    auto const length = storage.size(url);
    failIfTooLong(length.hasValue() ? length.value() : 0, label);
    std::string content;
    valueOrFail(
        storage.read(
            url,
            [&](char const* bytes, std::size_t count) {
                content.append(bytes, count);
                return true;
            }),
        "Run 'tav verify' to see what is damaged.");
    return content;
}

PictureCache cache()
{
    return {userFolder("XDG_CACHE_HOME", ".cache") + "/tav/pictures", kCacheSize};
}

std::string nameInCache(OdString const& url)
{
    auto const digest = digestOf(url);
    return digest ? hexOf(*digest) : std::string();
}

/// The picture of a stored content, which never changes: it is decoded once.
DrawingPicture storedPicture(common::RootPath const& root, OdString const& url, std::string const& label)
{
    PictureCache const kept = cache();
    std::string const name = nameInCache(url);
    if (auto const png = kept.find(name); png && !png->empty()) {
        if (auto image = decodePng(*png, kMostPixels)) {
            return {std::move(image), ""};
        }
    }
    DrawingPicture found = pictureIn(contentOf(root, url, label));
    kept.keep(name, found.image ? encodePng(*found.image) : std::string());
    return found;
}

/// The file of the commit that `typed` names.
Tree::value_type
fileOf(Tree const& files, std::string const& typed, CommitRecord const& commit, common::RootPath const& root)
{
    std::vector<common::StagedFile> all;
    all.reserve(files.size());
    for (auto const& [path, url] : files) {
        all.emplace_back(path, common::FileChange::added);
    }
    std::vector<common::StagedFile> const found = NameFinder(all, root).find(typed);
    if (found.size() != 1) {
        throw Failure(
            found.empty() ? "Commit " + std::to_string(commit.number) + " has no file '" + typed + "'."
                          : "'" + typed + "' is a folder of commit " + std::to_string(commit.number) + ".",
            "Run 'tav log' to see the commits, and name one drawing.");
    }
    return *files.find(found.front().path);
}

/// Whether nothing, an empty file or a PNG file has this name. What cannot be read may be a drawing.
bool mayBeReplaced(std::string const& file)
{
    os::Handle handle;
    if (std::error_code const error = os::openForReading(file, handle)) {
        return error == std::errc::no_such_file_or_directory;
    }
    std::array<char, kPngSignature.size()> beginning{};
    std::size_t count = 0;
    std::error_code const error = os::readBytes(handle, beginning.data(), beginning.size(), count);
    return !error && (count == 0 || std::string_view(beginning.data(), count) == kPngSignature);
}

} // namespace

DrawingVersion drawingVersion(
    common::RootPath const& root, LocalDatabase const& database, std::string const& typed, std::string const& commit)
{
    if (commit.empty()) {
        OdString const path = pathInRepository(root, typed);
        std::string const label = shown(path);
        return {path, label, pictureOrFail(pictureIn(contentInFolder(root, path)), label)};
    }
    CommitRecord const record = findCommit(database, commit);
    auto const [path, url] = fileOf(database.commits().files(record.hash), typed, record, root);
    std::string const label = shown(path) + " (commit " + std::to_string(record.number) + ")";
    return {path, label, pictureOrFail(storedPicture(root, url, label), label)};
}

std::optional<Image> storedPictureIfAny(common::RootPath const& root, OdString const& url)
{
    auto const kept = cache().find(nameInCache(url));
    bool const isKnownToHaveNone = kept && kept->empty();
    return isKnownToHaveNone ? std::nullopt : storedPicture(root, url, url.ansi_str()).image;
}

void writePicture(Image const& image, std::string const& file)
{
    if (!mayBeReplaced(file)) {
        throw Failure("'" + file + "' is there already, and is not a PNG file.", "Name another file with -o.");
    }
    std::string const png = encodePng(image);
    if (std::error_code const error = os::replaceFile(file, png)) {
        throw Failure("'" + file + "' cannot be written: " + error.message() + ".", "Name another file with -o.");
    }
}

void showPicture(Image const& image)
{
    PictureProtocol const protocol = pictureProtocol(isatty(STDOUT_FILENO) == 1, std::getenv);
    if (protocol == PictureProtocol::none) {
        throw Failure("Pictures cannot be shown here.", "Write the picture to a file with -o FILE.png.");
    }
    print(pictureText(protocol, scaledToFit(image, kWidthInTerminal, kHeightInTerminal)));
}

} // namespace tav
