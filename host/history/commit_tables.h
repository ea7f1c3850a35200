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
#include <unordered_map>
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

/// The same beside the commit, for whole histories of a path.
struct PathChange {
    std::int64_t commit = 0;  ///< number
    std::string path;         ///< as bytes, and so are the others: most of them are only compared
    std::string url;          ///< empty when the commit has no such file any more
    std::string previousPath; ///< of a file that the commit renamed, else empty
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
    /// Makes the index that the histories of files are read with. Without it they are slow.
    static void createIndex(Database& database);

    /// Adds a commit whose whole content is `files`; its parents must be there. Part of a `WriteTransaction` of the
    /// caller.
    void add(CommitRecord const& commit, std::vector<FileRecord> const& files);
    /// The same for what it changed against its first parent.
    void addChanges(CommitRecord const& commit, std::vector<FileRecord> const& changes);
    /// Removes all commits and references. Part of a `WriteTransaction` of the caller.
    void clear();

    std::optional<CommitRecord> find(OdString const& hash) const;
    std::optional<CommitRecord> find(std::int64_t number) const;
    /// The same for all of `numbers` that there are, in this order.
    std::vector<CommitRecord> find(std::vector<std::int64_t> const& numbers) const;
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

    /// The numbers of the parents of each commit that has some, in their order.
    std::unordered_map<std::int64_t, std::vector<std::int64_t>> parents() const;

    /// Whether any commit has, or has had, a file or folder `path`.
    bool hasPath(std::string const& path) const;
    /// What commits did to the file `path`, in ascending order of commits.
    std::vector<PathChange> changesOf(std::string const& path) const;
    /// The same for all files whose path begins with `folder`, the commits of each in ascending order.
    std::vector<PathChange> changesBelow(std::string const& folder) const;
    /// What a commit made of the file `path` that it renamed; none when it did not.
    std::optional<PathChange> renameFrom(std::int64_t commit, std::string const& path) const;

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
    /// Removes the reference of that name, if there is one. Part of a `WriteTransaction` of the caller.
    void removeReference(OdString const& name);
    /// The commits that are before `from`, or `from` itself, and not before `to`, in ascending order. An empty `to` is
    /// before the first commit.
    std::vector<CommitNumber> between(OdString const& from, OdString const& to) const;

private:
    std::int64_t numberOf(OdString const& hash) const;
    std::vector<PathChange> readChanges(Statement& rows) const;
    /// Numbers of the commit and its first parents, the oldest first.
    std::vector<std::int64_t> line(OdString const& hash) const;
    Statement prepareParents() const;
    /// Of the row that a statement stands on.
    CommitRecord commitOf(Statement const& row, Statement& parents) const;
    std::vector<CommitRecord> readAll(Statement statement) const;

    Database* database_;
    std::int64_t repository_;
};

} // namespace tav
