// The input becomes a configuration file. Loading it ends with a configuration or with an error that has a text, and a
// configuration that is saved is loaded again as it was.
#include "common/mu_common_config.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <optional>
#include <string>

namespace {

namespace fs = std::filesystem;

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

class Io final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override { require(outcome.hasValue()); }
};

// Below the system's folder for temporary files, and removed with the process.
class Folder {
public:
    Folder() : path_(fs::temp_directory_path() / "fuzz_config.XXXXXX") { require(mkdtemp(path_.data()) != nullptr); }
    Folder(Folder const&) = delete;
    Folder& operator=(Folder const&) = delete;
    ~Folder()
    {
        std::error_code ignored;
        fs::remove_all(path_, ignored);
    }

    OdString path() const { return {path_.c_str(), path_.size(), CP_UTF_8}; }

    void write(std::uint8_t const* data, std::size_t size) const
    {
        std::ofstream file(path_ + "/directories.state", std::ios::binary);
        require(!!file.write(reinterpret_cast<char const*>(data), static_cast<std::streamsize>(size)));
    }

private:
    std::string path_;
};

using Projects = std::map<OdString, common::ProjectInfo>;

/// The projects of the file, which is written anew with `save`; nothing when it is refused.
std::optional<Projects> load(OdString const& folder, bool save)
{
    static Io const io;
    auto const config = common::Config::load(folder, io);
    if (!config.hasValue()) {
        require(!config.error().message.isEmpty() && config.error().code == 0);
        return std::nullopt;
    }
    if (save) {
        config.value()->write();
    }
    return config.value()->read().projects;
}

// A character beyond U+FFFF is escaped in this locale and loses its upper bits.
OdString asWritten(OdString const& text)
{
    OdString written;
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        written += static_cast<wchar_t>(text.getAt(i) & 0xFFFF);
    }
    return written;
}

bool isWrittenAs(Projects const& before, Projects const& after)
{
    Projects written;
    for (auto const& [path, project] : before) {
        written.emplace(asWritten(path), common::ProjectInfo{asWritten(project.name), asWritten(project.cloud)});
    }
    return std::equal(written.begin(), written.end(), after.begin(), after.end(), [](auto const& a, auto const& b) {
        return a.first == b.first && a.second.name == b.second.name && a.second.cloud == b.second.cloud;
    });
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    static Folder const folder;
    folder.write(data, size);
    if (auto const before = load(folder.path(), true)) {
        auto const after = load(folder.path(), false);
        require(after && isWrittenAs(*before, *after));
    }
    return 0;
}
