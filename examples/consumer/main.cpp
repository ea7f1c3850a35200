// Makes a repository in the folder given, lists its files with their digests, and shows what an error looks like.
#include <common/mu_common_file_utils.h>
#include <common/mu_common_repo_prop.h>
#include <common/mu_common_versions.h>
#include <platform/ut/File.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>

namespace {

void print(OdString const& text)
{
    std::printf("%s\n", text.ansi_str().c_str());
}

OdString digestOf(OdString const& path)
{
    ut::File file;
    if (!file.open(path, ut::File::kRead)) {
        throw OdError(path + L" cannot be read.");
    }
    common::ContentDigest digest;
    std::array<char, 65'536> piece;
    std::uint64_t done = 0;
    while (std::size_t const count = file.read(piece.data(), piece.size())) {
        digest.update(piece.data(), count);
        done += count;
    }
    if (done < file.length()) {
        throw OdError(path + L" cannot be read.");
    }
    return digest.finish();
}

void listFiles(common::RootPath const& root)
{
    auto const files = common::collectRepoFiles(root);
    if (!files.hasValue()) {
        throw OdError(files.error().message);
    }
    for (common::File const& file : files.value()) {
        print(digestOf(root.pathTo(file.path)) + L"  " + file.path);
    }
}

} // namespace

int main(int argc, char** argv)
try {
    if (argc != 2) {
        std::fprintf(stderr, "usage: consumer FOLDER\n");
        return 2;
    }
    OdString const folder(argv[1], CP_UTF_8);
    auto const missing = common::RootPath::get(folder, false);
    print(missing.hasValue() ? OdString(L"There is a repository already.") : missing.error().message);
    listFiles(common::RootPath::get(folder, true).visit(GetRValueOrThrow<common::RootPath>{}));
    return 0;
} catch (OdError const& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 1;
}
