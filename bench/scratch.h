/// A folder to work in, and the commands that are raced in it.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace bench {

/// A new folder of its own, gone with the object.
class Scratch {
public:
    Scratch();
    Scratch(Scratch const&) = delete;
    Scratch& operator=(Scratch const&) = delete;
    ~Scratch();

    std::string pathTo(std::string const& name) const { return (path_ / name).string(); }

private:
    std::filesystem::path path_;
};

/// Writes a whole file, with its folders.
void writeFile(std::string const& path, std::string const& content);

/// Makes so many empty drawings below `root`, a hundred in a folder.
void makeDrawings(std::string const& root, int count);

/// Runs a program to its end, with `input` as its standard input and its output thrown away. Stops this one when it
/// fails.
void runCommand(std::vector<std::string> const& command, std::string const& input = "/dev/null");

/// `git -C folder`, without the settings of whoever runs this, and then `arguments`.
std::vector<std::string> git(std::string const& folder, std::vector<std::string> const& arguments);

} // namespace bench
