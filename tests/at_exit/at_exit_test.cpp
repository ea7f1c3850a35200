// Objects that a host destroys at the very end of its process, when the library's statics are gone.
#include "tests/support/temp_folder.h"

#include <array>
#include <cstdio>
#include <filesystem>
#include <gmock/gmock.h>
#include <string>

namespace {

using support::TempFolder;

/// What the late host prints when it keeps what the plug-in's function `name` makes for `folder`; and how it ends, when
/// that is not well.
std::string keeping(char const* name, std::string const& folder)
{
    std::string const command = "MALLOC_PERTURB_=165 " MU_LATE_HOST " " MU_LATE_PLUGIN " " + std::string(name) + " '" +
                                folder + "' 2>&1"; // Memory that is given back is overwritten, to make its use show.
    std::FILE* const output = popen(command.c_str(), "r");
    std::array<char, 4096> buffer;
    std::string text;
    while (std::size_t const got = std::fread(buffer.data(), 1, buffer.size(), output)) {
        text.append(buffer.data(), got);
    }
    int const status = pclose(output);
    return status == 0 ? text : text + "ended with " + std::to_string(status);
}

constexpr char const* kFreshState = R"({"head": {"reference": "master"}})";

TEST(AtExit, WritesAStateFromWholeNames)
{
    TempFolder const repository;
    repository.write(".tav/tav.state", kFreshState);
    EXPECT_EQ(keeping("keepState", repository.path()), "saved\n");
    EXPECT_EQ(repository.read(".tav/tav.state"), R"({
    "head" : {
        "reference" : "a branch with a long name"
    },
    "index" : [
        {
            "data" : {
                "last_checked" : 1700000000,
                "modified" : false
            },
            "path" : "plans/ground.dwg"
        }
    ],
    "renames" : [
        {
            "new" : "plans/roof-new.dwg",
            "previous" : "plans/roof.dwg"
        }
    ],
    "staged_files" : [
        {
            "file_change" : "modified",
            "path" : "plans/ground.dwg"
        }
    ]
})");
}

TEST(AtExit, WritesAConfigurationFromWholeNames)
{
    TempFolder const folder;
    folder.write("directories.state", "{}");
    EXPECT_EQ(keeping("keepConfiguration", folder.path()), "saved\n");
    EXPECT_EQ(folder.read("directories.state"), R"({
    "projects_map" : [
        {
            "info" : {
                "name" : "House at the lake",
                "uid" : "1234567"
            },
            "path" : "/projects/house"
        }
    ]
})");
}

TEST(AtExit, ReportsAStateThatCannotBeWritten)
{
    TempFolder const repository;
    repository.write(".tav/tav.state", kFreshState);
    EXPECT_EQ(
        keeping("keepStateOfAFolderThatGoes", repository.path()),
        "No state file found at " + repository.pathTo("elsewhere/.tav/tav.state") + "\nError writing to file '" +
            repository.pathTo(".tav/tav.state") + "'\n");
}

TEST(AtExit, LeavesTheNamesThatHostsUseWhole)
{
    TempFolder const folder;
    EXPECT_EQ(
        keeping("keepNames", folder.path()),
        ".master.head.reference.commit.staged_files.path.renames.new.previous.staged_references.references.name.type."
        "branch.tag.hash.blob_path.storagePath.previousPath.parentsHashes.annotation.commitHash.");
}

} // namespace
