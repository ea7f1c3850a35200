/// Running the commands of tav inside of a test program, where calls of the system can be made to fail and rights can
/// be given up.
#pragma once

#include "host/cli/command_line.h"

#include "tests/host/run_tav.h"

#include <string>
#include <vector>

namespace host_tests {

/// A command line as the system hands it over. The arguments outlive it.
class Words {
public:
    explicit Words(Arguments const& arguments)
    {
        for (std::string const& argument : arguments) {
            words_.push_back(const_cast<char*>(argument.c_str()));
        }
        words_.push_back(nullptr);
    }

    int count() const { return static_cast<int>(words_.size() - 1); }
    char** begin() { return words_.data(); }

private:
    std::vector<char*> words_ = {const_cast<char*>("tav")};
};

/// Runs the command that `arguments` name and returns its exit code. It prints on the streams of this process: call it
/// in a `Process`.
inline int runHere(Arguments const& arguments)
{
    Words words(arguments);
    return tav::run(words.count(), words.begin());
}

} // namespace host_tests
