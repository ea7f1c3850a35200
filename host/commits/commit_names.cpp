#include "host/commits/commit_names.h"

#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include <charconv>
#include <optional>

namespace tav {

namespace {

constexpr std::size_t kShortestPrefix = 4;

std::optional<std::int64_t> numberIn(std::string const& typed)
{
    std::int64_t number = 0;
    auto const [end, error] = std::from_chars(typed.data(), typed.data() + typed.size(), number);
    bool const isNumber = error == std::errc() && end == typed.data() + typed.size() && number > 0;
    return isNumber ? std::optional(number) : std::nullopt;
}

std::optional<CommitRecord> findByHash(CommitTables const& commits, std::string const& typed)
{
    if (typed.size() < kShortestPrefix) {
        return std::nullopt;
    }
    std::vector<CommitRecord> found = commits.withPrefix(fromUtf8(typed));
    if (found.size() > 1) {
        throw Failure("Several commits begin with '" + typed + "'.", "Type more of the hash, or the number.");
    }
    return found.empty() ? std::nullopt : std::optional(std::move(found.front()));
}

std::optional<CommitRecord> find(LocalDatabase const& database, std::string const& typed)
{
    CommitTables const& commits = database.commits();
    if (typed.empty()) {
        return commits.find(database.currentCommit());
    }
    if (auto const reference = commits.reference(fromUtf8(typed))) {
        return commits.find(reference->commitHash);
    }
    if (auto const number = numberIn(typed)) {
        if (auto commit = commits.find(*number)) {
            return commit;
        }
    }
    return findByHash(commits, typed);
}

} // namespace

CommitRecord findCommit(LocalDatabase const& database, std::string const& typed)
{
    if (auto commit = find(database, typed)) {
        return std::move(*commit);
    }
    if (typed.empty()) {
        throw Failure("There is no commit yet.", "Make the first one with 'tav add --all' and 'tav commit'.");
    }
    throw Failure("There is no commit, branch or tag '" + typed + "'.", "Run 'tav log' or 'tav branch' to see them.");
}

} // namespace tav
