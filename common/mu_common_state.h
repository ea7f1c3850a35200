/// The working state of a repository: what belongs to the working folder but not yet to a commit.
///
/// No operation here takes a lock. A cache and its transactions belong to one thread at a time; caches of one
/// repository share nothing but the file, and the one destroyed last wins.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_io_utils.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_repo_prop.h"

#include "platform/sdk/OdString.h"
#include "platform/ut/FileName.h"

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <vector>

namespace common {

/// The branch of a new repository. Never destroyed, as the names in `mu_common_json_keys.h`.
inline OdString const& s_defaultMaster = *new OdString(L"master");

/// What is known of one file of the working folder.
struct IndexData {
    std::uint64_t lastChecked = 0; ///< its modification time when it was last checked, in the ticks of `modifyTime`
    bool modified = false;         ///< whether the host has marked it as modified since then
};

/// The working state. Paths are relative to the working folder.
struct State {
    OdString head = s_defaultMaster; ///< the branch that HEAD points to
    /// A commit that the host keeps with HEAD. A state file with such a number cannot be read back: the reader expects
    /// it under a different key than the writer uses.
    std::optional<std::uint64_t> headCommit;
    std::vector<StagedFile> stagedFiles;  ///< what the next commit takes, in staging order
    std::map<OdString, OdString> renames; ///< new path of a file that moved, and its previous one
    std::map<OdString, IndexData> index;  ///< path of a file, and what is known of it
};

class Transaction;

/// Owns the working state of one repository and saves it on destruction. Only the destructor writes the state: a
/// process that ends without calling it loses the changes.
class MU_COMMON_EXPORT Cache {
public:
    /// Takes over a loaded state, which counts as unchanged. `io` is kept by address and must outlive the cache.
    Cache(RootPath const& root, State state, IoInterface const& io);
    /// Starts with a fresh state, which counts as changed.
    Cache(RootPath const& root, IoInterface const& io);
    /// A temporary host would be gone when the outcome is reported.
    ///@{
    Cache(RootPath const& root, State state, IoInterface const&& io) = delete;
    Cache(RootPath const& root, IoInterface const&& io) = delete;
    ///@}
    Cache(Cache const&) = delete;
    Cache& operator=(Cache const&) = delete;
    /// Saves a changed state and reports the outcome to the host, once; does neither for an unchanged one. Errors
    /// reported: a staged change that has no text form; the document cannot be built; the file cannot be written. After
    /// an error the file is unchanged, except when only its folder cannot be flushed: then it has the new state, but a
    /// crash may bring the old one back. After a crash at any time, the file is complete, old or new.
    ~Cache();

    /// Loads the state of `root` again for each call, and returns a separate cache to every caller. The repository must
    /// exist: see `RootPath::get` for its folder and `create` for its state file.
    /// Errors: no state file; one that cannot be read; not JSON; HEAD missing or not a branch; a member of the wrong
    /// type; an unknown staged change. The disk is unchanged in each case.
    static Expected<std::shared_ptr<Cache>> get(RootPath const& root, IoInterface const& io);
    /// A temporary host would be gone when the outcome is reported.
    static Expected<std::shared_ptr<Cache>> get(RootPath const& root, IoInterface const&& io) = delete;

    /// Writes the state file of a new repository, whose folder must exist, and reports the outcome to `io`. Does
    /// nothing when the file exists.
    static void create(RootPath const& root, IoInterface const& io);

    /// The state, for reading, valid as long as the cache.
    State const& read() const { return state_; }
    /// The state, for changing, valid as long as the cache, which counts as changed from here on.
    State& write();
    /// Begins a transaction: changes to the state are undone when the result is destroyed without a commit.
    [[nodiscard]] Transaction getTransaction();

private:
    friend class Transaction;

    WriteOutcome save() const;

    bool dirty_;
    State state_;
    ut::FileName stateFile_;
    IoInterface const* io_;
};

/// Undoes all changes to the state of a cache since its own construction, unless it is committed. Writes nothing
/// itself. The cache must outlive it. Transactions of one cache must end in the reverse order of their construction.
class MU_COMMON_EXPORT Transaction {
public:
    /// Copies the state of `cache`.
    explicit Transaction(Cache& cache);
    Transaction(Transaction const&) = delete;
    Transaction& operator=(Transaction const&) = delete;
    /// Without a commit, restores the copy; the cache then counts as changed, whether or not it was.
    ~Transaction();

    /// Keeps the changes.
    void commit() { committed_ = true; }

private:
    Cache& cache_;
    State snapshot_;
    bool committed_ = false;
};

/// The modification time of the working file `path`: nanoseconds since 1970-01-01T00:00:00Z, 0 for a file that cannot
/// be examined.
MU_COMMON_EXPORT std::uint64_t modifyTime(OdString const& path, RootPath const& root);

/// Records the current modification time of `path` in the index, not marked as modified. Adds the record when there is
/// none.
MU_COMMON_EXPORT void updateIndex(OdString const& path, Cache& cache, RootPath const& root);

/// Does the same for all staged files, in order, and drops the records of those staged as removed. The files stay
/// staged. Without staged files, the cache stays unchanged.
MU_COMMON_EXPORT void updateIndex(Cache& cache, RootPath const& root);

/// Drops the record of `path`, if there is one; the cache counts as changed either way.
MU_COMMON_EXPORT void removeIndex(OdString const& path, Cache& cache);

/// Converts a position in the index of `cache.read()` to a writable one; the cache counts as changed from here on.
MU_COMMON_EXPORT std::map<OdString, IndexData>::iterator
openForWrite(std::map<OdString, IndexData>::const_iterator const& position, Cache& cache);

} // namespace common
