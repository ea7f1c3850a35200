/// Answers for the staging step: what can be staged, what has been, and which file a typed name means.
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

/// How the working folder differs from the last commit. The host fills it in, by path: it compares `collectRepoFiles`
/// with the files of the last commit. Each path belongs to one list: one that both have to `unchanged` or `modified`
/// (for a content-hash URL `isDifferent` decides; a revision URL holds no digest, so the host compares with the stored
/// content), any other to `untracked` or `removed`.
struct RepoChanges {
    std::vector<File> files;                             ///< carried along; the explorer does not use them
    std::vector<VersionedFile> unchanged;                ///< as committed
    std::vector<Versions<File, VersionedFile>> modified; ///< in both, with different contents
    std::vector<Versions<File, void>> untracked;         ///< only in the working folder
    std::vector<Versions<void, VersionedFile>> removed;  ///< only in the commit
};

/// A selection of files to stage, made over the changes of one moment. It keeps its choices to itself: writing them
/// into the working state is the host's business. Movable; a moved-from explorer may only be destroyed. One thread at a
/// time.
///
/// Candidates are the modified files and then the new ones, each in the order of the changes. Removed files are never
/// candidates: they are committed without staging.
class MU_COMMON_EXPORT RepoFileExplorer {
public:
    /// Copies what it needs of both.
    RepoFileExplorer(RepoChanges const& changes, RootPath const& root);
    /// Takes everything over.
    ///@{
    RepoFileExplorer(RepoFileExplorer&& other) noexcept;
    RepoFileExplorer& operator=(RepoFileExplorer&& other) noexcept;
    ///@}
    ~RepoFileExplorer();

    /// Whether a candidate is left that is not staged.
    bool hasFilesToStage() const;
    /// Stages the first candidate equal to `file`. False when there is none, or when it was staged before.
    bool stage(StagedFile const& file);
    /// What a commit would take: once any candidate is staged, all candidates; before that nothing, provided that files
    /// were removed. Error: nothing is staged and nothing removed.
    Expected<std::vector<StatusRef>> stagedFiles() const;
    /// All candidates, staged or not.
    std::vector<StatusRef> possibleStageFiles() const;

    /// The one candidate whose path matches `name` (see `filePattern`); nothing when none does; an error when two do.
    /// Throws `std::regex_error` as `filePattern` does.
    std::variant<StagedFile, std::monostate, ErrorMessage> findForStaging(OdString const& name) const;
    /// The path of the first unchanged file that matches `name`, or an empty text. Throws likewise.
    OdString findUnchanged(OdString const& name) const;

private:
    struct Pimpl;
    std::unique_ptr<Pimpl> pimpl_;
};

/// The expression by which a name that the user typed is matched against whole paths: anything may stand before the
/// name, and when the name has no extension, any chain of alphabetic ones must follow it. The characters of the name
/// are not escaped: a dot in it matches any character, and expressions may be typed. Throws `std::regex_error` for a
/// name that does not make a valid expression, and for one that could exhaust the stack or take more than about a
/// second for a path of 1,024 bytes. Besides the other bounds of `RepoIgnore`, there is room for two loops like `.*`,
/// one of which is in front of the name, where there is a back reference.
///
/// So that matching ends in bounded time, an expression without back references has other flags than the default ones:
/// those of the standard library's polynomial algorithm, and `nosubs`. It has no sub-matches.
MU_COMMON_EXPORT std::regex filePattern(OdString const& name);

} // namespace common
