#include "bench/scratch.h"

#include "bench/documents.h"
#include "bench/race.h"
#include "platform/sdk/OdString.h"

#include <cstdlib>
#include <fstream>

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

namespace bench {

Scratch::Scratch()
{
    std::string name = (std::filesystem::temp_directory_path() / "mu_bench_XXXXXX").string();
    check(mkdtemp(name.data()) != nullptr, "no temporary folder");
    path_ = name;
}

Scratch::~Scratch()
{
    std::filesystem::remove_all(path_);
}

void writeFile(std::string const& path, std::string const& content)
{
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    std::ofstream file(path, std::ios::binary);
    file << content;
    file.close();
    check(file.good(), "a file cannot be written");
}

void makeDrawings(std::string const& root, int count)
{
    for (int i = 0; i < count; ++i) {
        std::wstring const path = drawingPath(i);
        writeFile(root + "/" + OdString(path.c_str(), path.size()).ansi_str(), "");
    }
}

void runCommand(std::vector<std::string> const& command, std::string const& input)
{
    std::vector<std::string> words = command;
    std::vector<char*> arguments;
    for (std::string& word : words) {
        arguments.push_back(word.data());
    }
    arguments.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, input.c_str(), O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    pid_t child = 0;
    check(
        posix_spawnp(&child, arguments.front(), &actions, nullptr, arguments.data(), environ) == 0, "no such command");
    posix_spawn_file_actions_destroy(&actions);
    int status = 0;
    check(waitpid(child, &status, 0) == child && status == 0, "a command failed");
}

std::vector<std::string> git(std::string const& folder, std::vector<std::string> const& arguments)
{
    setenv("GIT_CONFIG_GLOBAL", "/dev/null", 1);
    setenv("GIT_CONFIG_NOSYSTEM", "1", 1);
    std::vector<std::string> command = {"git", "-C", folder};
    command.insert(command.end(), arguments.begin(), arguments.end());
    return command;
}

} // namespace bench
