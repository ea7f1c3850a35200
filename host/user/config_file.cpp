#include "host/user/config_file.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <cstdint>
#include <filesystem>
#include <utility>

namespace tav {

namespace {

using kutils::json::Value;
using kutils::json::Value_type;

constexpr std::uint64_t kMostBytes = 1 << 20;

std::wstring memberName(std::string const& key)
{
    return jsonText(fromUtf8(key)).get_string();
}

std::string bytesOf(std::wstring const& text)
{
    return withoutPairs(OdString(text.data(), text.size())).ansi_str();
}

/// Who may not even look into the folder, as under sudo, has no settings there.
bool isOutOfReach(std::string const& path)
{
    std::error_code error;
    std::filesystem::file_status const status = std::filesystem::symlink_status(path, error);
    return status.type() == std::filesystem::file_type::none && error == std::errc::permission_denied;
}

/// A file that somebody else wrote may be of any length.
std::string readShortFile(std::string const& path)
{
    os::OpenFile file;
    std::uint64_t length = 0;
    std::error_code error = file.openForReading(path);
    bool const isMissing = error == std::errc::no_such_file_or_directory || error == std::errc::not_a_directory;
    if (isMissing || (error && isOutOfReach(path))) {
        return "{}";
    }
    error = error ? error : file.length(length);
    if (!error && length > kMostBytes) {
        throw Failure("The settings '" + path + "' have more than 1 MiB.", "Move that file away.");
    }
    std::string text(length, '\0');
    std::size_t done = 0;
    error = error ? error : file.readAt(0, text.data(), text.size(), done);
    if (error) {
        throw Failure(
            "The settings '" + path + "' cannot be read: " + error.message() + ".",
            "Check your permissions for that file.");
    }
    text.resize(done);
    return text;
}

} // namespace

ConfigFile::ConfigFile(std::string path) : path_(std::move(path))
{
    Value document;
    bool const isJson = kutils::json::read_string(document, fromUtf8(readShortFile(path_)));
    if (!isJson || document.type() != Value_type::object) {
        throw Failure("The settings '" + path_ + "' are not a JSON object.", "Correct that file, or move it away.");
    }
    members_ = std::move(document.get_object());
}

std::vector<std::string> ConfigFile::keys() const
{
    std::vector<std::string> keys;
    for (auto const& [key, value] : members_) {
        keys.push_back(bytesOf(key));
    }
    return keys;
}

std::optional<std::string> ConfigFile::text(std::string const& key) const
{
    auto const member = members_.find(memberName(key));
    bool const isText = member != members_.end() && member->second.type() == Value_type::string;
    return isText ? std::optional(bytesOf(member->second.get_string())) : std::nullopt;
}

void ConfigFile::set(std::string const& key, std::string const& value)
{
    members_[memberName(key)] = jsonText(fromUtf8(value));
}

bool ConfigFile::remove(std::string const& key)
{
    return members_.erase(memberName(key)) > 0;
}

void ConfigFile::save() const
{
    std::wstring const text = kutils::json::write_string(members_, true);
    if (auto const error = os::replaceFile(path_, OdString(text.data(), text.size()).ansi_str() + "\n")) {
        throw Failure(
            "The settings '" + path_ + "' cannot be written: " + error.message() + ".",
            "Check the free space and your permissions there.");
    }
}

} // namespace tav
