#include "host/cli/arguments.h"

#include "host/errors/failure.h"

#include <charconv>
#include <filesystem>

namespace tav {

namespace {

bool isFile(std::string const& name)
{
    std::error_code error;
    return std::filesystem::exists(std::filesystem::symlink_status(name, error));
}

std::optional<CommitRecord> commitNamed(std::string const& word, LocalDatabase const& database)
{
    auto commit = word.empty() ? std::nullopt : findCommitIfAny(database, word);
    if (commit && isFile(word)) {
        throw Failure(
            "'" + word + "' names commit " + std::to_string(commit->number) + ", and a file too.",
            "Type it before '--' for the commit, and after '--' for the file.");
    }
    return commit;
}

void failIfTooMany(std::size_t count, std::size_t most)
{
    if (count > most) {
        throw Failure(
            "There are " + std::to_string(count) + " commits before '--'.",
            "Name at most " + std::to_string(most) + "; names of files come after '--'.");
    }
}

} // namespace

CommitsAndNames split(WordList const& list, LocalDatabase const& database, std::size_t most)
{
    CommitsAndNames found;
    auto word = list.words.begin();
    if (list.names) {
        auto const end = list.words.end() - static_cast<std::ptrdiff_t>(*list.names);
        failIfTooMany(static_cast<std::size_t>(end - word), most);
        for (; word != end; ++word) {
            found.commits.push_back(findCommit(database, *word));
        }
    }
    for (; !list.names && word != list.words.end() && found.commits.size() < most; ++word) {
        auto commit = commitNamed(*word, database);
        if (!commit) {
            break;
        }
        found.commits.push_back(std::move(*commit));
    }
    found.names.assign(word, list.words.end());
    return found;
}

std::optional<std::size_t> takeCount(WordList& list)
{
    std::size_t const inFront = list.words.size() - list.names.value_or(0);
    for (std::size_t i = inFront; i > 0; --i) {
        std::string const& word = list.words[i - 1];
        std::size_t count = 0;
        char const* const end = word.data() + word.size();
        bool const isCount =
            word.size() > 1 && word[0] == '-' && std::from_chars(word.data() + 1, end, count).ptr == end && count > 0;
        if (isCount) {
            list.words.erase(list.words.begin() + static_cast<std::ptrdiff_t>(i - 1));
            return count;
        }
    }
    return std::nullopt;
}

} // namespace tav
