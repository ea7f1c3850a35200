#include "host/cli/commit_message.h"

#include "host/cli/current_settings.h"
#include "host/cli/programs.h"
#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <iostream>
#include <iterator>
#include <sstream>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr std::size_t kMostChanges = 1000; // More would only slow down the editor.

std::string comment(std::vector<std::string> const& changes)
{
    std::string text = "# Say what has changed, and why. Lines that begin with '#' are ignored.\n"
                       "# Without a message, nothing is committed.\n";
    text += changes.empty() ? "" : "#\n# This will be committed:\n";
    for (std::size_t i = 0; i < std::min(changes.size(), kMostChanges); ++i) {
        text += "#   " + changes[i] + "\n";
    }
    if (changes.size() > kMostChanges) {
        text += "#   and " + std::to_string(changes.size() - kMostChanges) + " more\n";
    }
    return text;
}

std::string trimmed(std::string const& text)
{
    std::size_t const first = text.find_first_not_of('\n');
    return first == std::string::npos ? "" : text.substr(first, text.find_last_not_of('\n') + 1 - first);
}

std::string withoutComments(std::string const& text)
{
    std::istringstream lines(text);
    std::string result;
    for (std::string line; std::getline(lines, line);) {
        if (line.empty() || line.front() != '#') {
            line.erase(line.find_last_not_of(" \t\r") + 1);
            result += line + "\n";
        }
    }
    return trimmed(result);
}

void write(std::string const& path, std::string const& text)
{
    os::OpenFile file;
    std::error_code error = file.create(path, 0600);
    error = error ? error : file.writeAt(0, text);
    if (error) {
        throw Failure(
            "'" + path + "' cannot be written: " + error.message() + ".",
            "Nothing has been committed; give the message with -m.");
    }
}

/// What was written before; a link is nobody's message.
std::string readKept(std::string const& path)
{
    std::error_code ignored;
    std::string text;
    bool const isFile = fs::is_regular_file(fs::symlink_status(path, ignored));
    return isFile && !os::readFile(path, text) ? withoutComments(text) : "";
}

/// A byte that belongs to no character becomes a surrogate of its own.
bool isUtf8(std::string const& bytes)
{
    OdString const text = fromUtf8(bytes);
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        if (text.getAt(i) >= 0xDC80 && text.getAt(i) <= 0xDCFF) {
            return false;
        }
    }
    return true;
}

} // namespace

std::string readMessage(std::string const& path)
{
    std::string text;
    if (path == "-") {
        text.assign(std::istreambuf_iterator<char>(std::cin), {});
    } else if (auto const error = os::readFile(path, text)) {
        throw Failure("'" + path + "' cannot be read: " + error.message() + ".", "Nothing has been committed.");
    }
    if (!isUtf8(text)) {
        throw Failure(
            "The message in " + (path == "-" ? "standard input" : "'" + path + "'") + " is not UTF-8.",
            "Nothing has been committed; save the message as UTF-8, or give it with -m.");
    }
    return trimmed(text);
}

bool canEdit()
{
    return isatty(STDIN_FILENO) == 1 && isatty(STDOUT_FILENO) == 1;
}

std::string messagePath(common::RootPath const& root)
{
    return root.tavPath().ansi_str() + "/COMMIT_MESSAGE";
}

void removeMessage(common::RootPath const& root)
{
    std::error_code ignored;
    fs::remove(messagePath(root), ignored); // The commit is made, and the next message begins with what is left.
}

std::string
editMessage(common::RootPath const& root, std::vector<std::string> const& changes, std::string const& former)
{
    std::string const path = messagePath(root);
    std::string const kept = readKept(path);
    removeMessage(root);
    write(path, (kept.empty() ? former : kept) + "\n" + comment(changes));
    std::string const editor = currentSettings().value("editor");
    if (runProgram({"sh", "-c", editor + " \"$@\"", editor, path}) != 0) {
        throw Failure(
            "The editor '" + editor + "' failed.",
            "Nothing has been committed; give the message with -m, or name another editor with 'tav config editor'.");
    }
    std::string const message = readKept(path);
    removeMessage(root);
    if (!message.empty()) {
        write(path, message + "\n");
    }
    return message;
}

} // namespace tav
