/// The command line of tav.
#pragma once

namespace tav {

/// Exit codes of every command.
enum ExitCode {
    kDone = 0,
    kFailed = 1, ///< the answer is no, or the job failed
    kMisused = 2,
};

/// Runs the command that the arguments name and returns its exit code. Nothing is thrown.
int run(int argc, char** argv);

} // namespace tav
