/// The repository: its root, every path inside it, and its ignore rules.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"

#include "platform/sdk/OdString.h"

#include <regex>
#include <vector>

namespace common {

/// One repository: a working folder of drawings with a folder ".tav" directly inside it.
///
/// A plain value that holds the path of the working folder; copies are interchangeable and may be read from any thread.
/// The operations that compose paths cannot fail and never access the disk. They join two parts with one separator and
/// do not examine either part, so a part that begins with a separator gives two. Nothing is resolved or made absolute,
/// and paths are case-sensitive.
class MU_COMMON_EXPORT RootPath {
public:
    /// Takes the path of the working folder without its trailing separators.
    RootPath(OdString const& path);

    /// Opens the repository whose working folder is `path`, or with `create` makes it: the working folder with its
    /// missing parents, and an empty ".tav". Only a ".tav" directly inside `path` counts: parent folders are not
    /// searched. Opening an existing repository does not change the disk.
    /// Errors: not a repository (without `create`); the working folder, or ".tav" in it, cannot be made.
    static Expected<RootPath> get(OdString const& path, bool create);

    /// ".tav" inside `path`, which is used as given.
    static OdString tavPath(OdString const& path);

    OdString tavPath() const;        ///< ".tav" inside the working folder
    OdString statePath() const;      ///< the state file
    OdString dbPath() const;         ///< the local database, which is the host's
    OdString propertiesPath() const; ///< the folder of files that travel with the repository
    OdString logPath() const;        ///< the log file
    OdString conflictPath() const;   ///< the folder of the other versions of conflicted files

    /// The working folder.
    OdString path() const;
    /// `relative` inside the working folder.
    OdString pathTo(OdString const& relative) const;
    /// `relative` inside the conflict folder, with its sub-folders.
    OdString conflictPathTo(OdString const& relative) const;

    /// The path of the incoming copy of the conflicted drawing `file`, relative to the working folder. The folders of
    /// `file` are dropped: drawings with the same name in different folders share their conflict copies.
    OdString relativeToTheirs(OdString const& file) const;
    /// The path of the common ancestor of the conflicted drawing `file`, composed in the same way.
    OdString relativeToBase(OdString const& file) const;

    /// The part of `path` below the working folder, compared as plain text.
    /// Error: `path` does not begin with the working folder and a separator. The placeholder in its text is not filled
    /// in.
    Expected<OdString> relativePathTo(OdString const& path) const;

private:
    OdString root_;
};

/// The extension of revision stores in the local storage, without the dot; storage URLs of drawings begin with it.
MU_COMMON_EXPORT OdString repositoryExt();

/// The ignore rules of a repository: which names the scan of the working folder skips.
///
/// They are in the file "ignore" of the properties folder, one regular expression per line (ECMAScript, case-sensitive,
/// matched against whole names), up to the end of the file or the first empty line. There are no comments, and blanks
/// belong to the expression. Without the file, backup drawings (.bak) and lock files (.dwl, .dwl2) are ignored.
///
/// A snapshot: later changes to the file have no effect. One thread at a time.
class MU_COMMON_EXPORT RepoIgnore {
public:
    /// Loads the rules of `root`. Throws `std::regex_error` for a line that is not a valid expression, and for one that
    /// could exhaust the stack or take more than about a second for one file name, however unlikely that name is.
    /// Refused are: groups nested deeper than 100; more than about 8,000 characters in a row, 4,000 alternatives, 4,000
    /// classes like `[a-z]`, or 16,000 characters in all (counted repetitions are written out, except for classes);
    /// thousands of `\b` after a loop; repeated look-aheads that contain many repetitions or are numerous; and, in an
    /// expression with a back reference, nested loops that can divide a text in several ways, as in `(a*)*`, or more
    /// than two loops like `.*` whose end is not determined by the next character (three in a very short expression).
    /// Throws `OdError`, naming the file, when the ignore file exists but cannot be read.
    explicit RepoIgnore(RootPath const& root);

    /// Appends the rules again. Throws as the constructor does.
    void load();

    /// Full path of the ignore file, whether or not it exists.
    OdString ignorePath() const;
    /// The compiled rules, in the order of the file.
    std::vector<std::regex> expressions() const;
    /// The texts of the rules, in the same order.
    std::vector<OdString> rules() const;
    /// Whether a scan skips `name`, that is, whether any rule matches all of it. Takes bounded time for a name that a
    /// file can have. Throws `std::regex_error` for a rule with a back reference and a name of more than 1,024 bytes.
    bool matches(OdString const& name) const;

    /// Creates the ignore file with the default rules; an existing file is left unchanged, which is success. The
    /// properties folder must exist. Error: the file could not be written.
    static WriteOutcome write(RootPath const& root);

    /// Compiles one rule. Throws as the constructor does, for a host that checks a rule before it writes it.
    static std::regex compile(OdString const& rule);

private:
    void append(OdString const& rule);

    OdString ignorePath_;
    std::vector<std::regex> expressions_;
    std::vector<OdString> rules_;
};

} // namespace common
