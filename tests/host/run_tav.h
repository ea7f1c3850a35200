/// Running tav as its users do: in a process of its own, with everything it prints kept.
#pragma once

#include <functional>
#include <iosfwd>
#include <string>
#include <sys/types.h>
#include <vector>

namespace host_tests {

/// How a process ended, and what it printed.
struct Outcome {
    int code; ///< the exit code; of a process that a signal has ended, the negative number of the signal
    std::string out;
    std::string err;
};

bool operator==(Outcome const& a, Outcome const& b);
void PrintTo(Outcome const& outcome, std::ostream* stream);

/// The three ways a command ends; what is not named is empty.
///@{
Outcome done(std::string const& out);
Outcome failed(std::string const& err);
Outcome misused(std::string const& err);
///@}

/// The home folder of every process that is run, which also holds the server and the list of projects: "data" and
/// "config" in it. It lives as long as the test program.
std::string const& home();

/// The surroundings of a process.
struct Setting {
    std::string folder = "/";             ///< the current folder
    std::vector<std::string> environment; ///< added to the test's own, as "NAME=value"
    bool isOnTerminal = false;            ///< both streams are terminals; else both are pipes
    std::string input;                    ///< what is typed on the terminal, if there is one; else there is no input
    std::string outFile;                  ///< where standard output goes instead, such as "/dev/full"
    std::string program = TAV_PROGRAM;
};

using Arguments = std::vector<std::string>;

/// A child process. It is killed, and waited for, when this goes.
class Process {
public:
    /// Starts the program of `setting` with `arguments`.
    Process(Setting const& setting, Arguments const& arguments);
    /// Runs `body` in a copy of this process, which ends with the exit code that it returns.
    Process(Setting const& setting, std::function<int()> const& body);
    Process(Process const&) = delete;
    Process& operator=(Process const&) = delete;
    ~Process();

    pid_t id() const { return child_; }
    bool isRunning();
    void send(int signal) const;
    Outcome wait();

private:
    void start(Setting const& setting, std::function<int()> const& body);
    bool reap(int options);

    pid_t child_ = -1;
    int in_ = -1;
    int out_ = -1;
    int err_ = -1;
    int status_ = 0;
    bool isReaped_ = false;
};

/// Runs tav to its end.
Outcome run(Setting const& setting, Arguments const& arguments);

} // namespace host_tests
