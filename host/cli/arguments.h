/// Lists on the command line in which commits come before names of files.
#pragma once

#include "host/commits/commit_names.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// The words of such a list as they were typed, without "--".
struct WordList {
    std::vector<std::string> words;
    std::optional<std::size_t> names; ///< how many words at the end came after "--", if that was typed
};

struct CommitsAndNames {
    std::vector<CommitRecord> commits;
    std::vector<std::string> names;
};

/// All words after "--" are names of files, and all words before it are commits. Without it, the leading words that
/// name commits are commits, and the rest are names of files. There are at most `most` commits. Throws `Failure` for a
/// word that names both a commit and a file, and when there are more commits.
CommitsAndNames split(WordList const& list, LocalDatabase const& database, std::size_t most);

/// Removes the last word of the form "-5" before "--" from `list`.
std::optional<std::size_t> takeCount(WordList& list);

} // namespace tav
