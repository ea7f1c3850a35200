/// Staging: which files can be staged, which have been, and which file a typed name means.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_repo_prop.h"
#include "common/mu_common_versions.h"

#include "platform/sdk/OdString.h"

#include <memory>
#include <regex>
#include <variant>
#include <vector>

namespace common {

/// How the working folder differs from the last commit. The host program fills it in: it compares the paths of
/// `collectRepoFiles` with those of the last commit. Each path belongs to one list. A path that both have belongs to
/// `unchanged` or `modified` (for a content-hash URL, `isDifferent` decides; a revision URL contains no digest, so the
/// host compares with the stored content), any other to `untracked` or `removed`.
struct RepoChanges {
    std::vector<File> files;                             ///< not used by the explorer
    std::vector<VersionedFile> unchanged;                ///< as committed
    std::vector<Versions<File, VersionedFile>> modified; ///< in both, with different contents
    std::vector<Versions<File, void>> untracked;         ///< only in the working folder
    std::vector<Versions<void, VersionedFile>> removed;  ///< only in the commit
};

/// A selection of files to stage, based on the changes at one time. It only records the selection: writing it into the
/// working state is up to the host. Movable; a moved-from explorer may only be destroyed. One thread at a time.
///
/// Candidates are the modified files and then the new ones, each in the order of the changes. Removed files are never
/// candidates: they are committed without staging.
class MU_COMMON_EXPORT RepoFileExplorer {
public:
    /// Copies what it needs from both.
    RepoFileExplorer(RepoChanges const& changes, RootPath const& root);
    /// Moves everything.
    ///@{
    RepoFileExplorer(RepoFileExplorer&& other) noexcept;
    RepoFileExplorer& operator=(RepoFileExplorer&& other) noexcept;
    ///@}
    ~RepoFileExplorer();

    /// Whether any candidate is not staged.
    bool hasFilesToStage() const;
    /// Stages the first candidate equal to `file`. False when there is none, or when it is staged already.
    bool stage(StagedFile const& file);
    /// What a commit would take: all candidates once any of them is staged; before that nothing, provided that files
    /// were removed. Error: nothing is staged and nothing was removed.
    Expected<std::vector<StatusRef>> stagedFiles() const;
    /// All candidates, staged or not.
    std::vector<StatusRef> possibleStageFiles() const;

    /// The one candidate whose path matches `name` (see `filePattern`); nothing when none does; an error when two do.
    /// Throws `std::regex_error` as `filePattern` does.
    std::variant<StagedFile, std::monostate, ErrorMessage> findForStaging(OdString const& name) const;
    /// The path of the first unchanged file that matches `name`, or an empty text. Throws like `findForStaging`.
    OdString findUnchanged(OdString const& name) const;

private:
    struct Pimpl;
    std::unique_ptr<Pimpl> pimpl_;
};

/// The expression that matches a typed name against whole paths: anything may precede the name, and if the name has no
/// extension, one or more alphabetic extensions must follow it. The characters of the name are not escaped: a dot in it
/// matches any character, and the user can type an expression. Throws `std::regex_error` for a name that does not make
/// a valid expression, and for one that could exhaust the stack or take more than about a second for a path of 1,024
/// bytes. The other limits of `RepoIgnore` apply too; with a back reference, two loops like `.*` are allowed, one of
/// which is the one before the name.
///
/// To match in bounded time, an expression without back references does not have the default flags, but those of the
/// standard library's polynomial algorithm, and `nosubs`. It has no sub-matches.
MU_COMMON_EXPORT std::regex filePattern(OdString const& name);

} // namespace common
