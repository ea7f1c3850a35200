/// A small repository that a test can have again and again as it was, to see what a command makes of it.
#pragma once

#include "tests/host/run_tav.h"
#include "tests/support/temp_folder.h"

#include "common/mu_common_repo_prop.h"

#include <functional>
#include <map>
#include <ostream>
#include <string>
#include <vector>

namespace host_tests {

/// Contents by path in the working folder.
using Files = std::map<std::string, std::string>;

/// Whether every file of `now` is as in one of the others, and missing only where it is missing in one of them.
bool areOldOrNew(Files const& now, Files const& before, Files const& after);

class Scene;

/// A command, and what it finds.
struct SceneRow {
    friend void PrintTo(SceneRow const& row, std::ostream* stream) { *stream << row.name; }

    char const* name;
    Arguments arguments;
    std::function<void(Scene const&)> prepare;
    bool isVerifiedFirst = true; ///< else `verify` would find fault with what the command is to bring about
};

/// Two commits of three files, their server, and what `prepare` adds to that. All of it lies in "now" of a folder for
/// itself and is copied to "first": `reset` makes "now" what "first" is.
class Scene {
public:
    explicit Scene(std::function<void(Scene const&)> const& prepare);

    void reset() const;

    support::TempFolder const& place() const { return place_; }
    std::string folder() const { return place_.pathTo("now/repository"); } ///< the working folder
    common::RootPath root() const;

    /// Writes a file of the working folder, with a modification time of long ago that no other file has.
    void write(std::string const& name, std::string const& content) const;
    /// Runs a command as a user does, without waiting for the disk.
    Outcome tav(Arguments const& arguments) const;
    /// Runs `body` in a copy of this process that stands in the working folder, without waiting for the disk. Calls of
    /// SQLite go through `os::calls()`.
    Outcome inCopy(std::function<int()> const& body) const;

    /// What a user does after a failure: sees that all versions are there, and runs the command again, or the other way
    /// round.
    Outcome verifyAndRepeat(SceneRow const& row) const;

    Files files() const;
    /// What a command is to bring about, in lines: contents, the names of everything in ".tav" and the folder of the
    /// server, the lengths of objects, the state and the history, without what differs from run to run. Folders of the
    /// working folder do not count when they are empty.
    std::string situation() const;

    /// What a user has: contents, what is staged and renamed, the references, and where the folder stands.
    std::string work() const;
    /// Empties the log of operations.
    void forgetOperations() const;

private:
    support::TempFolder const place_;
    mutable int written_ = 0;
};

/// Bytes that do not get smaller, others for each `seed`.
std::string drawing(unsigned seed, std::size_t size = 3000);
/// The same with a few bytes changed, so that it is stored as a difference.
std::string edited(std::string content, unsigned seed);

/// The lines that only one of two texts has.
std::string difference(std::string const& before, std::string const& after);

/// What is wrong with the end of a command that failed: empty when it says in one line what is the matter and what to
/// do, and nothing else.
std::string faultOfFailure(Outcome const& outcome);

/// Whether a command that was repeated has succeeded. It may say that it has completed what was interrupted.
bool isDone(Outcome const& outcome);

/// The commands whose failures and crashes are tested: each writes, replaces and removes something.
std::vector<SceneRow> const& sceneRows();

/// The same for commands that can be undone.
std::vector<SceneRow> const& undoRows();

/// The same for commands whose changes are in databases: they bring the history here and that of the server together,
/// go to another branch, or bring the database to its present form.
std::vector<SceneRow> const& historyRows();

} // namespace host_tests
