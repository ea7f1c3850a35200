/// Other programs that tav starts for the user.
#pragma once

#include <string>
#include <sys/types.h>
#include <vector>

namespace tav {

/// Starts the program `words[0]`, looked for as the shell does, with the rest as its arguments. Its standard input is
/// the file `input`. Signals that tav handles are as usual for it. Throws `Failure` when it cannot be started.
pid_t startProgram(std::vector<std::string> const& words, int input);

/// Waits for its end and returns its exit status; of one that a signal has ended, -1.
int waitFor(pid_t program);

/// Both, with the input of tav. The keys that interrupt tav are the program's meanwhile.
int runProgram(std::vector<std::string> const& words);

} // namespace tav
