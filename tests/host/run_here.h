/// Running the commands of tav inside of a test program, where calls of the system can be made to fail and rights can
/// be given up.
#pragma once

#include "host/cli/command_line.h"

#include "tests/host/run_tav.h"

#include <string>
#include <vector>

namespace host_tests {

/// Runs the command that `arguments` name and returns its exit code. It prints on the streams of this process: call it
/// in a `Process`.
inline int runHere(Arguments const& arguments)
{
    std::vector<char*> words = {const_cast<char*>("tav")};
    for (std::string const& argument : arguments) {
        words.push_back(const_cast<char*>(argument.c_str()));
    }
    words.push_back(nullptr);
    return tav::run(static_cast<int>(words.size() - 1), words.data());
}

} // namespace host_tests
