// The input becomes the ignore file of a repository with a handful of files. Whatever it holds, reading it and scanning
// by it end with a list of those files or with std::regex_error.
#include "common/mu_common_file_utils.h"
#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <regex>
#include <set>
#include <string>
#include <vector>

namespace {

namespace fs = std::filesystem;

/// Names that patterns are likely to be about; one long, one of no valid encoding.
std::set<std::string> const kNames = {
    "plan.dwg",
    "plan.bak",
    "plan.dwl2",
    "old/a.dwg",
    "old/a b.txt",
    "\u5e73\u9762\u56fe.dwg",
    "\xFF\x80.dwg",
    "aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaab"};
std::string const kIgnoreFile = ".tav/properties/ignore";

class Repository {
public:
    Repository()
    {
        std::string name = (fs::temp_directory_path() / "fuzz_ignore_file.XXXXXX").string();
        if (!mkdtemp(name.data())) {
            std::abort();
        }
        folder_ = name;
        for (std::string const& file : kNames) {
            write(file, {});
        }
    }
    Repository(Repository const&) = delete;
    Repository& operator=(Repository const&) = delete;
    ~Repository()
    {
        std::error_code ignored;
        fs::remove_all(folder_, ignored);
    }

    void write(std::string const& name, std::string const& content) const
    {
        fs::create_directories((folder_ / name).parent_path());
        if (!(std::ofstream(folder_ / name, std::ios::binary) << content)) {
            std::abort();
        }
    }

    common::RootPath root() const { return common::RootPath(OdString(folder_.c_str(), CP_UTF_8)); }

private:
    fs::path folder_;
};

void check(Expected<std::vector<common::File>> const& files)
{
    if (!files.hasValue()) {
        std::abort();
    }
    for (common::File const& file : files.value()) {
        std::string const path = file.path.ansi_str();
        if (kNames.count(path) == 0 && path != kIgnoreFile) {
            std::abort();
        }
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    static Repository const repository;
    repository.write(kIgnoreFile, std::string(reinterpret_cast<char const*>(data), size));
    try {
        check(common::collectRepoFiles(repository.root()));
    } catch (std::regex_error const&) {
        // An invalid line is refused as a whole.
    }
    return 0;
}
