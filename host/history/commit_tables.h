/// Commits, their files and references, as tables of a database. The server and each working folder keep theirs so.
///
/// A commit keeps its number, its parents and what it changed against the first of them; its files are put together
/// again from the changes of all commits before it. Parents have lower numbers than their children. One thread. Every
/// operation throws `Failure` when the database cannot be used.
#pragma once

#include "host/database/sqlite.h"

#include "common/mu_common_serialization.h"

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// A commit without its files.
struct CommitRecord {
    std::int64_t number = 0; ///< the server's running number, from 1
    OdString hash;
    OdString author;
    OdString message;
    std::int64_t date = 0; ///< seconds since 1970-01-01T00:00:00Z
    std::vector<OdString> parents;
};

struct CommitNumber {
    std::int64_t number = 0;
    OdString hash;
};

/// What a commit did to one path.
struct FileRecord {
    OdString path;
    OdString url;          ///< empty when the commit has no such file any more
    OdString previousPath; ///< of a file that the commit renamed, else empty
};

/// A file of a commit.
struct FileVersion {
    OdString path;
    std::int64_t commit = 0; ///< number
};

/// The files of a commit: storage URL by path.
using Tree = std::map<OdString, OdString>;

struct ListedFile {
    OdString path;
    std::string url; ///< as bytes: few of the URLs of a list are ever looked at
};

/// The files of a commit in the order of paths: made and gone through in half the time that a `Tree` takes.
using FileList = std::vector<ListedFile>;

class CommitTables {
public:
    /// The tables of the repository `repository` in `database`, which lives longer.
    CommitTables(Database& database, std::int64_t repository);

    /// Makes the tables in a new database.
    static void create(Database& database);

    /// Adds a commit whose whole content is `files`; its parents must be there. Part of a `WriteTransaction` of the
    /// caller.
    void add(CommitRecord const& commit, std::vector<FileRecord> const& files);
    /// The same for what it changed against its first parent.
    void addChanges(CommitRecord const& commit, std::vector<FileRecord> const& changes);
    /// Removes all commits and references. Part of a `WriteTransaction` of the caller.
    void clear();

    std::optional<CommitRecord> find(OdString const& hash) const;
    std::optional<CommitRecord> find(std::int64_t number) const;
    /// The commits whose hash begins with `prefix`, two at most.
    std::vector<CommitRecord> withPrefix(OdString const& prefix) const;
    /// All commits with a number above `number`, in ascending order.
    std::vector<CommitRecord> after(std::int64_t number) const;
    /// `hash` and all commits before it, newest first; an empty `hash` has none.
    std::vector<CommitRecord> history(OdString const& hash) const;
    bool isBefore(OdString const& ancestor, OdString const& hash) const; ///< or the same
    std::int64_t lastNumber() const;                                     ///< 0 when there is no commit
    /// The last number up to which no commit is missing; 0 when the first one is.
    std::int64_t lastWithoutGap() const;
    /// All commits from the number `first` on, in ascending order.
    std::vector<CommitNumber> numbersFrom(std::int64_t first) const;

    /// The files of a commit; none for an empty `hash`, which stands for what is before the first commit.
    FileList fileList(OdString const& hash) const;
    Tree files(OdString const& hash) const; ///< the same
    /// What a commit changed against its first parent, in the order of paths.
    std::vector<FileRecord> changes(OdString const& hash) const;
    /// The URLs of all files of all commits, in ascending order.
    std::vector<OdString> urls() const;

    /// The file that had the content at `url` first; an empty path when there is none.
    FileVersion firstFileAt(OdString const& url) const;

    /// In the order of names.
    std::vector<common::Reference> references() const;
    std::optional<common::Reference> reference(OdString const& name) const;
    /// Makes a reference, or moves the one of that name. Its commit must be there. Part of a `WriteTransaction` of the
    /// caller.
    void set(common::Reference const& reference);

private:
    std::int64_t numberOf(OdString const& hash) const;
    std::vector<OdString> parentsOf(std::int64_t number) const;
    /// Numbers of the commit and its first parents, the oldest first.
    std::vector<std::int64_t> line(OdString const& hash) const;
    std::vector<CommitRecord> readAll(Statement statement) const;

    Database* database_;
    std::int64_t repository_;
};

} // namespace tav
