#include "host/cli/opened_copy.h"

#include "host/changes/digest.h"
#include "host/cli/output.h"
#include "host/cli/programs.h"
#include "host/errors/failure.h"
#include "host/text/utf8.h"
#include "host/user/settings.h"
#include "host/user/user_folders.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <climits>
#include <filesystem>
#include <string_view>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kNext = "Check the folder 'tav' in XDG_CACHE_HOME, by default in '~/.cache'.";
constexpr std::chrono::hours kAge(30 * 24);
constexpr std::string_view kUnfinished = ".unfinished-";

std::string folderOfCopies()
{
    return userFolder("XDG_CACHE_HOME", ".cache") + "/tav/open";
}

bool holds(std::string const& file, Digest const& digest)
{
    return fileDigest(fromUtf8(file)) == digest;
}

/// "roof (commit 12).dwg", cut where it would be too long for a name.
std::string nameOfCopy(std::string const& name, std::string const& note)
{
    std::string const ending = " (" + note + ")" + fs::path(name).extension().string();
    std::string stem = fs::path(name).stem().string();
    std::size_t const room = NAME_MAX - std::min<std::size_t>(ending.size(), NAME_MAX);
    if (stem.size() > room) {
        std::size_t end = room;
        while (end > 0 && (static_cast<unsigned char>(stem[end]) & 0xC0U) == 0x80U) { // Inside of a character.
            --end;
        }
        stem.resize(end);
    }
    return stem + ending;
}

/// Removes what nobody has changed: an editor may have saved work there.
void removeCopies(fs::path const& folder, Digest const& digest)
{
    std::error_code ignored;
    for (fs::directory_entry const& entry : fs::directory_iterator(folder, ignored)) {
        bool const isUnfinished = entry.path().filename().string().compare(0, kUnfinished.size(), kUnfinished) == 0;
        if (isUnfinished || holds(entry.path().string(), digest)) {
            fs::remove(entry.path(), ignored);
        }
    }
    fs::remove(folder, ignored); // Fails for one that has files.
}

void removeOldCopies()
{
    std::error_code ignored;
    auto const oldest = fs::file_time_type::clock::now() - kAge;
    for (fs::directory_entry const& entry : fs::directory_iterator(folderOfCopies(), ignored)) {
        auto const digest = digestFromHex(entry.path().filename().string());
        bool const isFolder = entry.symlink_status(ignored).type() == fs::file_type::directory;
        if (digest && isFolder && entry.last_write_time(ignored) < oldest) {
            removeCopies(entry.path(), *digest);
        }
    }
}

/// The path where the copy is, or can be made.
std::string placeFor(std::string const& name, std::string const& note, Digest const& digest, std::string const& folder)
{
    std::string path = folder + "/" + nameOfCopy(name, note);
    for (int number = 2; fs::exists(fs::symlink_status(path)) && !holds(path, digest); ++number) {
        path = folder + "/" + nameOfCopy(name, note + ", " + std::to_string(number));
    }
    return path;
}

std::string lowerCase(std::string text)
{
    std::transform(text.begin(), text.end(), text.begin(), [](char c) {
        return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    });
    return text;
}

/// By its name, a file that a desktop, or a program for drawings, would run.
bool isNameOfProgram(std::string const& file)
{
    constexpr std::array kEndings = {
        ".action", ".app",  ".appimage", ".arx", ".bash", ".bat", ".bin", ".cmd", ".com",  ".command",    ".cpl",
        ".csh",    ".deb",  ".desktop",  ".dll", ".dvb",  ".elf", ".exe", ".fas", ".fish", ".flatpakref", ".hta",
        ".jar",    ".jnlp", ".js",       ".jse", ".lnk",  ".lsp", ".lua", ".mnl", ".msi",  ".php",        ".pif",
        ".pl",     ".ps1",  ".py",       ".pyc", ".rb",   ".reg", ".rpm", ".run", ".scr",  ".service",    ".sh",
        ".snap",   ".so",   ".tcl",      ".url", ".vbe",  ".vbs", ".vlx", ".wsf", ".wsh",  ".zsh"};
    std::string const ending = lowerCase(fs::path(file).extension().string());
    return std::any_of(kEndings.begin(), kEndings.end(), [&](char const* known) { return ending == known; });
}

/// By its beginning: a desktop looks there when the name says nothing.
bool beginsLikeProgram(std::string const& file)
{
    std::array<char, 512> beginning{};
    os::Handle handle;
    std::size_t count = 0;
    if (os::openForReading(file, handle) || os::readBytes(handle, beginning.data(), beginning.size(), count)) {
        return true;
    }
    std::string_view const text(beginning.data(), count);
    auto const beginsWith = [&](std::string_view sign) { return text.substr(0, sign.size()) == sign; };
    return beginsWith("#!") ||
           beginsWith("\x7f"
                      "ELF") ||
           text.find("[Desktop ") != std::string_view::npos;
}

std::vector<std::string> commandFor(std::string const& file)
{
    SettingEntry const program = Settings("").effective("open.program"); // No repository has a say in it.
    return program.origin == Origin::standard
               ? std::vector<std::string>{program.value, file}
               : std::vector<std::string>{"sh", "-c", program.value + " \"$@\"", program.value, file};
}

int runViewer(std::string const& file)
{
    try {
        return runProgram(commandFor(file));
    } catch (Failure& failure) {
        failure.next = "Install it, or name another program with 'tav config open.program'.";
        throw;
    }
}

} // namespace

std::string makeReadOnlyCopy(
    std::string const& name, std::string const& note, Digest const& digest,
    std::function<void(std::string const& path)> const& write)
{
    removeOldCopies();
    std::string const folder = folderOfCopies() + "/" + hexOf(digest);
    if (std::error_code const error = os::makeFolders(folder, 0700)) {
        throw Failure("'" + folder + "' cannot be made: " + error.message() + ".", kNext);
    }
    std::string path = placeFor(name, note, digest, folder);
    if (fs::exists(fs::symlink_status(path))) {
        return path;
    }
    std::string const unfinished = folder + "/" + std::string(kUnfinished) + std::to_string(getpid());
    static_cast<void>(os::removeUnflushed(unfinished)); // Of a process of this number that was killed.
    write(unfinished);
    chmod(unfinished.c_str(), 0400);
    if (std::error_code const error = os::renameUnflushed(unfinished, path)) {
        throw Failure("'" + path + "' cannot be written: " + error.message() + ".", kNext);
    }
    return path;
}

void openWithProgram(std::string const& file)
{
    if (isNameOfProgram(file) || beginsLikeProgram(file)) {
        throw Failure(
            "'" + file + "' may be a program, and opening it could run it.",
            "Look at it with 'tav cat', or open the copy yourself.");
    }
    report("Opening '" + shown(fromUtf8(file)) + "', a read-only copy.\n");
    flushOutput();
    if (runViewer(file) != 0) {
        throw Failure(
            "The program to open '" + file + "' has failed.", "Name another one with 'tav config open.program'.");
    }
}

} // namespace tav
