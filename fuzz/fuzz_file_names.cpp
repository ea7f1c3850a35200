// File names of any bytes: to text and back, and to the disk and back.
#include "platform/sdk/OdString.h"
#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"
#include "platform/ut/TextFile.h"

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <string>

namespace {

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

// Below the system's folder for temporary files, and removed with the process.
class Folder {
public:
    Folder() : path_(std::filesystem::temp_directory_path() / "mu_fuzz_XXXXXX")
    {
        require(mkdtemp(path_.data()) != nullptr);
    }
    Folder(Folder const&) = delete;
    Folder& operator=(Folder const&) = delete;
    ~Folder() { std::filesystem::remove_all(path_); }

    OdString path() const { return {path_.c_str(), path_.size(), CP_UTF_8}; }

private:
    std::string path_;
};

bool fitsTheDisk(std::string const& name)
{
    return !name.empty() && name.size() <= 255 && name != "." && name != ".." &&
           name.find_first_of(std::string("/\0", 2)) == std::string::npos;
}

void tryDisk(OdString const& name)
{
    static Folder const folder;
    OdString const path = ut::FileName(folder.path(), name, L"").getFullPath();
    ut::TextFile file(path);
    file.addLine(name);
    require(file.write());

    ut::Dir dir;
    OdString listed;
    require(dir.open(folder.path()));
    require(dir.getFirst(listed, L"", ut::Dir::kFiles | ut::Dir::kHidden));
    require(listed == name);
    require(!dir.getNext(listed));
    require(std::filesystem::remove(path.ansi_str()));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string const bytes(reinterpret_cast<char const*>(data), size);
    OdString const text(bytes.data(), bytes.size(), CP_UTF_8);
    require(text.ansi_str() == bytes);
    require(text.getLength() <= size);
    if (fitsTheDisk(bytes)) {
        tryDisk(text);
    }
    return 0;
}
