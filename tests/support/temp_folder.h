/// A folder that lives as long as a test.
#pragma once

#include "platform/sdk/OdString.h"

#include <string>
#include <string_view>
#include <vector>

namespace support {

/// Makes a new, empty folder below the system's folder for temporary files and removes it with all that is in it.
/// Names are bytes and relative to the folder; missing parents are made. A helper that fails ends the test run with a
/// message, so that no test goes on in a place that is not what it asked for.
class TempFolder {
public:
    TempFolder();
    TempFolder(TempFolder const&) = delete;
    TempFolder& operator=(TempFolder const&) = delete;
    ~TempFolder();

    /// Full path, in bytes and as the library takes it.
    std::string const& path() const { return path_; }
    OdString widePath() const;
    /// Full path of `name` inside the folder, in bytes and as the library takes it.
    std::string pathTo(std::string_view name) const;
    OdString widePathTo(std::string_view name) const;

    void write(std::string_view name, std::string_view content) const;
    std::string read(std::string_view name) const;
    void makeFolder(std::string_view name) const;
    void makeLink(std::string_view name, std::string const& target) const;
    bool has(std::string_view name) const;
    /// Names of all entries below the folder, hidden ones too, sorted by bytes; folders end with a slash.
    std::vector<std::string> list() const;

private:
    std::string path_;
};

} // namespace support
