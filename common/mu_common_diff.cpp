#include "common/mu_common_diff.h"

#include "common/mu_common_pattern.h"
#include "common/mu_common_translate.h"

#include "platform/ut/FileName.h"

#include <algorithm>
#include <string_view>
#include <unordered_map>
#include <utility>

namespace common {

namespace {

struct CandidateHash {
    std::size_t operator()(StagedFile const* file) const
    {
        std::wstring_view const path(file->path.c_str(), file->path.getLength());
        return std::hash<std::wstring_view>()(path) * 3 + static_cast<std::size_t>(file->change);
    }
};

struct CandidateEqual {
    bool operator()(StagedFile const* a, StagedFile const* b) const { return *a == *b; }
};

std::vector<StagedFile> candidatesOf(RepoChanges const& changes)
{
    std::vector<StagedFile> candidates;
    candidates.reserve(changes.modified.size() + changes.untracked.size());
    for (Versions<File, VersionedFile> const& file : changes.modified) {
        candidates.emplace_back(file.working.path, FileChange::modified);
    }
    for (Versions<File, void> const& file : changes.untracked) {
        candidates.emplace_back(file.working.path, FileChange::added);
    }
    return candidates;
}

} // namespace

struct RepoFileExplorer::Pimpl {
    Pimpl(RepoChanges const& changes, RootPath const& repository)
        : removed(changes.removed)
        , candidates(candidatesOf(changes))
        , repeated(candidates.size())
        , staged(candidates.size())
        , unchanged(changes.unchanged)
        , root(repository)
    {
        positions.reserve(candidates.size());
        for (std::size_t i = 0; i < candidates.size(); ++i) {
            repeated[i] = !positions.emplace(&candidates[i], i).second; // The first of several equal ones is kept.
        }
    }

    /// The position of the first candidate equal to `file`, or the end. As a rule files are staged in the order of the
    /// candidates, so the one behind the last is tried first: a look-up has to fetch five places of far memory.
    std::size_t find(StagedFile const& file) const
    {
        if (next < candidates.size() && !repeated[next] && candidates[next] == file) {
            return next;
        }
        auto const position = positions.find(&file);
        return position == positions.end() ? candidates.size() : position->second;
    }

    std::vector<Versions<void, VersionedFile>> removed;
    std::vector<StagedFile> candidates;
    std::vector<bool> repeated; ///< of each candidate, whether an equal one comes before it
    std::vector<bool> staged;   ///< of each candidate, whether it is
    std::size_t stagedCount = 0;
    std::size_t next = 0; ///< behind the candidate that was staged last
    std::vector<VersionedFile> unchanged;
    RootPath root;
    /// Candidates by what they are: searching the list for each of many would take quadratic time.
    std::unordered_map<StagedFile const*, std::size_t, CandidateHash, CandidateEqual> positions;
};

RepoFileExplorer::RepoFileExplorer(RepoChanges const& changes, RootPath const& root)
    : pimpl_(std::make_unique<Pimpl>(changes, root))
{
}

RepoFileExplorer::RepoFileExplorer(RepoFileExplorer&& other) noexcept = default;

RepoFileExplorer& RepoFileExplorer::operator=(RepoFileExplorer&& other) noexcept = default;

RepoFileExplorer::~RepoFileExplorer() = default;

bool RepoFileExplorer::hasFilesToStage() const
{
    return pimpl_->stagedCount < pimpl_->candidates.size();
}

bool RepoFileExplorer::stage(StagedFile const& file)
{
    std::size_t const position = pimpl_->find(file);
    if (position == pimpl_->candidates.size() || pimpl_->staged[position]) {
        return false;
    }
    pimpl_->staged[position] = true;
    pimpl_->next = position + 1;
    ++pimpl_->stagedCount;
    return true;
}

Expected<std::vector<StatusRef>> RepoFileExplorer::stagedFiles() const
{
    if (pimpl_->stagedCount == 0) {
        if (pimpl_->removed.empty()) {
            return ErrorMessage(translate(L"There are no modified or untracked files for commit."));
        }
        return std::vector<StatusRef>();
    }
    std::vector<StatusRef> files = possibleStageFiles();
    for (std::size_t i = 0; i < files.size(); ++i) {
        files[i].selected = files[i].selected || pimpl_->staged[i];
    }
    return files;
}

std::vector<StatusRef> RepoFileExplorer::possibleStageFiles() const
{
    std::vector<StatusRef> files;
    files.reserve(pimpl_->candidates.size());
    for (StagedFile const& candidate : pimpl_->candidates) {
        files.emplace_back(candidate.path, candidate.change);
    }
    return files;
}

std::variant<StagedFile, std::monostate, ErrorMessage> RepoFileExplorer::findForStaging(OdString const& name) const
{
    std::regex const pattern = filePattern(name);
    StagedFile const* found = nullptr;
    for (StagedFile const& candidate : pimpl_->candidates) {
        if (!matchesWhole(pattern, candidate.path.ansi_str())) {
            continue;
        }
        if (found) {
            return ErrorMessage(translate(L"More that one file found with name %ls.\n"), name.c_str());
        }
        found = &candidate;
    }
    if (!found) {
        return std::monostate{};
    }
    return *found;
}

OdString RepoFileExplorer::findUnchanged(OdString const& name) const
{
    std::regex const pattern = filePattern(name);
    auto const match = std::find_if(pimpl_->unchanged.begin(), pimpl_->unchanged.end(), [&](VersionedFile const& file) {
        return matchesWhole(pattern, file.path.ansi_str());
    });
    return match == pimpl_->unchanged.end() ? OdString() : match->path;
}

std::regex filePattern(OdString const& name)
{
    OdString pattern = OdString(L".*") + name;
    if (!ut::FileName(name).hasExt()) {
        pattern += LR"((\.[a-zA-Z]+)+$)";
    }
    return compilePattern(pattern, kLongestText);
}

} // namespace common
