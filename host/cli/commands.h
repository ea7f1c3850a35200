/// The commands of tav, each in a source file of its name, and their options. A command that fails throws `Failure`.
#pragma once

#include "host/cli/arguments.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace tav {

struct InitOptions {
    std::string folder = ".";
    std::optional<std::string> server; ///< none: where it was, or in the folder for data
    bool nested = false;               ///< also in a folder of another repository
};
void init(InitOptions const& options);

struct StatusOptions {
    bool ignored = false;
    bool isShort = false;
    bool json = false;
};
void showStatus(StatusOptions const& options);

struct AddOptions {
    std::vector<std::string> names;
    bool all = false; ///< instead of names
};
void addFilesToStage(AddOptions const& options);

struct UnstageOptions {
    std::vector<std::string> names;
    bool all = false; ///< instead of names
};
void unstageFiles(UnstageOptions const& options);

struct MvOptions {
    std::string from;
    std::string to; ///< a path, or a folder to move it into
    bool dryRun = false;
};
void moveFiles(MvOptions const& options);

struct RmOptions {
    std::vector<std::string> names;
    bool dryRun = false;
};
void removeFiles(RmOptions const& options);

struct CommitOptions {
    std::optional<std::string> message;
    std::string messageFile;    ///< "-" for standard input; without both the message is written in an editor
    bool takesModified = false; ///< changed files without staging
    std::string author;         ///< empty: the user on this machine
    bool allRemoved = false;
    bool withoutRemoved = false;
    bool amends = false;       ///< the current commit is replaced
    bool keepsMessage = false; ///< of the commit that is replaced
};
void makeCommit(CommitOptions const& options);

struct RevertOptions {
    std::string commit;
    std::optional<std::string> message; ///< none: one that names the commit
};
void revertCommit(RevertOptions const& options);

struct StashOptions {
    std::vector<std::string> words; ///< what to do, and with which stash or which files; none: put everything aside
    std::string message;
    bool json = false;
};
void stash(StashOptions const& options);

struct LogOptions {
    WordList arguments; ///< the commit to begin with, and names
    std::string since;
    std::string until;
    std::string author;    ///< a part of the name; empty: all
    std::size_t count = 0; ///< 0: all
    bool all = false;      ///< the history of all branches and tags
    bool oneline = false;
    bool json = false;
};
void showLog(LogOptions const& options);

struct ShowOptions {
    std::string commit; ///< empty: where the user is
    bool json = false;
};
void showCommit(ShowOptions const& options);

/// "COMMIT:NAME"
void printFile(std::string const& typed);

struct OpenOptions {
    std::string name; ///< "COMMIT:NAME", or the name of a file of the current commit
    bool printsPath = false;
};
void openFile(OpenOptions const& options);

struct DiffOptions {
    WordList arguments; ///< up to two commits, and names; no name: all files
    bool stat = false;
    bool text = false;
    bool json = false;
};
void showDifferences(DiffOptions const& options);

struct PreviewOptions {
    std::string name; ///< "NAME" or "NAME@COMMIT"
    std::string file; ///< to write; empty: shown in the terminal
    bool json = false;
};
void showPreview(PreviewOptions const& options);

struct CompareOptions {
    std::string name;
    std::string before = "HEAD"; ///< a commit
    std::string after;           ///< a commit; empty: the working folder
    std::string file;            ///< to write; empty: shown in the terminal
    bool open = false;           ///< shown by a program instead
    bool json = false;
};
void compareDrawing(CompareOptions const& options);

struct RestoreOptions {
    std::vector<std::string> names;
    std::string commit;                ///< empty: where the user is
    std::optional<std::string> target; ///< where one file is written instead of its own path
    bool force = false;
    bool dryRun = false;
};
void restoreFiles(RestoreOptions const& options);

struct CheckoutOptions {
    std::string target;
    std::string commit; ///< where a new branch begins; empty: where the user is
    bool isNew = false; ///< the branch is created
    bool force = false;
    bool dryRun = false;
};
void checkOut(CheckoutOptions const& options);
void switchBranch(CheckoutOptions const& options);

struct UndoOptions {
    bool list = false;
    std::size_t count = 0; ///< of those that are listed; 0: all
    bool dryRun = false;
    bool force = false;
    bool json = false;
};
void undo(UndoOptions const& options);
void redo(UndoOptions const& options);

struct ReferenceOptions {
    std::optional<std::string> name; ///< of a new one; without it they are listed
    std::string commit;              ///< empty: where the user is; the new name of a branch that is renamed
    bool isDeleted = false;
    bool isRenamed = false;
    bool force = false; ///< also if no other branch or tag leads to the commits
    bool dryRun = false;
    bool json = false;
};
void branch(ReferenceOptions const& options);
void tag(ReferenceOptions const& options);

struct FilesOptions {
    std::string folder; ///< empty: the repository that the user is in
    std::string commit; ///< whose files are listed; empty: those of the working folder
    bool hash = false;
    bool isLong = false; ///< with the last commit of each file, of the current commit if none is named
    bool json = false;
};
void listFiles(FilesOptions const& options);

struct IgnoreOptions {
    std::optional<std::string> added;   ///< a rule or wildcard; without one of the three, the rules are listed
    std::optional<std::string> removed; ///< the same
    std::optional<std::string> name;    ///< which rule ignores it
    bool dryRun = false;
    bool json = false;
};
void ignore(IgnoreOptions const& options);

void fetch();

struct ServerOptions {
    std::string folder; ///< empty: where it is
    bool send = false;
};
void server(ServerOptions const& options);

struct ConfigOptions {
    std::optional<std::string> key; ///< none: all are listed
    std::optional<std::string> value;
    bool user = false;       ///< in the file of the user; new values go there unless the repository is named
    bool repository = false; ///< in the file of the repository
    bool unset = false;
    bool json = false;
};
void config(ConfigOptions const& options);

struct ProjectsOptions {
    std::optional<std::string> forgotten; ///< name or path of one that goes off the list; without it, they are listed
    bool json = false;
};
void projects(ProjectsOptions const& options);

void verifyAll(bool json);

struct GcOptions {
    bool dryRun = false;
    bool dropsUndo = false; ///< forgets what could be undone
};
void collectGarbage(GcOptions const& options);
void exportCommit(std::string const& typed, std::string const& target);

} // namespace tav
