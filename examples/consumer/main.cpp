// Makes a repository in the folder given, lists its files with their digests, and shows what an error looks like.
#include <common/mu_common_file_utils.h>
#include <common/mu_common_repo_prop.h>
#include <common/mu_common_versions.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>

namespace {

void print(OdString const& text)
{
    std::printf("%s\n", text.ansi_str().c_str());
}

std::string contentOf(OdString const& path)
{
    std::ifstream file(path.ansi_str(), std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void listFiles(common::RootPath const& root)
{
    auto const files = common::collectRepoFiles(root);
    if (!files.hasValue()) {
        throw OdError(files.error().message);
    }
    for (common::File const& file : files.value()) {
        std::string const content = contentOf(root.pathTo(file.path));
        print(generateSha(content.data(), static_cast<int>(content.size())) + L"  " + file.path);
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
