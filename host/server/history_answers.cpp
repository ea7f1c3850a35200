#include "host/server/history_answers.h"

#include "host/protocol/fetch_document.h"
#include "host/protocol/history_document.h"
#include "host/text/json_text.h"

#include <map>
#include <utility>

namespace tav {

namespace {

constexpr std::size_t kMostTrees = 8;

/// Puts the files of commits together, one commit after the other, from those of their parents.
class Trees {
public:
    Trees(HistorySnapshot const& history, std::vector<CommitRecord> const& commits) : history_(history)
    {
        for (CommitRecord const& commit : commits) {
            if (!commit.parents.empty()) {
                ++waiting_[commit.parents.front()];
            }
        }
    }

    /// The files of the next commit, which made `changes`.
    Tree next(CommitRecord const& commit, std::vector<FileRecord> const& changes)
    {
        Tree tree = commit.parents.empty() ? Tree() : filesOfParent(commit.parents.front());
        for (FileRecord const& change : changes) {
            if (change.url.isEmpty()) {
                tree.erase(change.path);
            } else {
                tree.insert_or_assign(change.path, change.url);
            }
        }
        keepForChildren(commit.hash, tree);
        return tree;
    }

private:
    Tree filesOfParent(OdString const& parent)
    {
        auto const kept = kept_.find(parent);
        bool const isLast = --waiting_[parent] == 0;
        if (kept == kept_.end()) {
            Tree tree = history_.files(parent);
            keepForChildren(parent, tree);
            return tree;
        }
        return isLast ? std::move(kept_.extract(kept).mapped()) : kept->second;
    }

    void keepForChildren(OdString const& hash, Tree const& tree)
    {
        auto const waiting = waiting_.find(hash);
        if (waiting == waiting_.end() || waiting->second == 0) {
            return;
        }
        if (kept_.size() == kMostTrees) {
            kept_.erase(kept_.begin()); // Any will do: what is missed is read again.
        }
        kept_.emplace(hash, tree);
    }

    HistorySnapshot const& history_;
    std::map<OdString, int> waiting_; ///< commits to come whose first parent it is
    std::map<OdString, Tree> kept_;
};

OdString commitsText(HistorySnapshot const& history, std::int64_t known)
{
    std::vector<CommitRecord> const commits = history.after(known);
    Trees trees(history, commits);
    OdString text;
    for (CommitRecord const& commit : commits) {
        ChangedCommit const changed{commit, history.changes(commit.hash)};
        text += text.isEmpty() ? L"" : L",";
        text += wholeCommitText(changed, trees.next(commit, changed.changes));
    }
    return text;
}

} // namespace

OdString fetchAnswer(Repository const& repository, HistorySnapshot const& history, std::int64_t known)
{
    OdString text = L"{\"commits\":[" + commitsText(history, known) + L"],\"references\":";
    text += compactText(referencesDocument(history.references())) + L",\"repository\":";
    return text + compactText(repositoryDocument(repository.id, repository.name)) + L"}";
}

OdString historyPage(HistorySnapshot const& history, std::int64_t known, std::size_t mostChanges)
{
    OdString text;
    std::size_t count = 0;
    while (auto commit = history.find(++known)) {
        ChangedCommit const changed{*commit, history.changes(commit->hash)};
        count += changed.changes.size() + 1; // A commit without changes takes room too.
        if (!text.isEmpty() && count > mostChanges) {
            break;
        }
        text += text.isEmpty() ? L"" : L",";
        text += changedCommitText(changed);
    }
    return L"{\"commits\":[" + text + L"]}";
}

} // namespace tav
