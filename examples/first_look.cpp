#include "common/mu_common_file_utils.h"
#include "common/mu_common_repo_prop.h"

#include <cstdio>

int main(int argc, char** argv)
{
    OdString const folder(argc > 1 ? argv[1] : ".", CP_UTF_8);
    auto root = common::RootPath::get(folder, true); // Opens the repository, or makes one.
    if (!root.hasValue()) {
        std::fprintf(stderr, "%s\n", root.error().message.ansi_str().c_str());
        return 1;
    }
    auto files = common::collectRepoFiles(root.value()); // Drawings and all the rest, less what is ignored.
    if (!files.hasValue()) {
        std::fprintf(stderr, "%s\n", files.error().message.ansi_str().c_str());
        return 1;
    }
    for (common::File const& file : files.value()) {
        std::printf("%s\n", file.path.ansi_str().c_str());
    }
}
