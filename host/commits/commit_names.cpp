#include "host/commits/commit_names.h"

#include "host/errors/failure.h"
#include "host/text/dates.h"
#include "host/text/utf8.h"

#include <charconv>
#include <chrono>
#include <optional>
#include <string_view>

namespace tav {

namespace {

constexpr std::size_t kShortestPrefix = 4;
constexpr char const* kSeeAll = "Run 'tav log' or 'tav branch' to see them, or 'tav fetch' for those of others.";
constexpr char const* kSeeLog = "Run 'tav log' to see the commits.";

std::optional<std::int64_t> numberIn(std::string_view typed)
{
    std::int64_t number = 0;
    auto const [end, error] = std::from_chars(typed.data(), typed.data() + typed.size(), number);
    bool const isNumber = error == std::errc() && end == typed.data() + typed.size() && number >= 0;
    return isNumber ? std::optional(number) : std::nullopt;
}

std::optional<CommitRecord> findByHash(CommitTables const& commits, std::string const& typed)
{
    if (typed.size() < kShortestPrefix) {
        return std::nullopt;
    }
    std::vector<CommitRecord> found = commits.withPrefix(fromUtf8(typed));
    if (found.size() > 1) {
        throw Failure(
            "The commits " + std::to_string(found[0].number) + " and " + std::to_string(found[1].number) +
                " begin with '" + typed + "'.",
            "Type more of the hash, or the number.");
    }
    return found.empty() ? std::nullopt : std::optional(std::move(found.front()));
}

std::optional<CommitRecord> findByReference(CommitTables const& commits, std::string const& typed)
{
    auto const reference = commits.reference(fromUtf8(typed));
    return reference ? commits.find(reference->commitHash) : std::nullopt;
}

std::int64_t now()
{
    using namespace std::chrono;
    return duration_cast<seconds>(system_clock::now().time_since_epoch()).count();
}

std::optional<CommitRecord> firstParent(CommitTables const& commits, CommitRecord const& commit)
{
    return commit.parents.empty() ? std::nullopt : commits.find(commit.parents.front());
}

/// "BRANCH@{DATE}"
std::optional<CommitRecord> findByDate(LocalDatabase const& database, std::string const& typed)
{
    std::size_t const opening = typed.find("@{");
    if (opening == std::string::npos || typed.back() != '}') {
        return std::nullopt;
    }
    std::string const date = typed.substr(opening + 2, typed.size() - opening - 3);
    auto const span = parseDate(date, now());
    if (!span) {
        throw Failure("'" + date + "' is not a date.", "Type one as '2024-03-05', 'yesterday' or '3 days ago'.");
    }
    CommitTables const& commits = database.commits();
    auto commit =
        opening == 0 ? commits.find(database.currentCommit()) : findByReference(commits, typed.substr(0, opening));
    while (commit && commit->date > span->last) {
        commit = firstParent(commits, *commit);
        if (!commit) {
            throw Failure("No commit had been made by '" + date + "'.", kSeeLog);
        }
    }
    return commit;
}

std::optional<CommitRecord> findStart(LocalDatabase const& database, std::string const& typed)
{
    CommitTables const& commits = database.commits();
    if (auto commit = findByReference(commits, typed)) {
        return commit;
    }
    if (typed.empty() || typed == "@" || typed == "HEAD") {
        return commits.find(database.currentCommit());
    }
    if (auto const number = numberIn(typed)) {
        if (auto commit = commits.find(*number)) {
            return commit;
        }
    }
    if (auto commit = findByDate(database, typed)) {
        return commit;
    }
    return findByHash(commits, typed);
}

/// A step from a commit to one before it, "~2" or "^", and what is typed in front.
struct Step {
    std::string front;
    char kind;
    std::int64_t count;
};

std::optional<Step> lastStep(std::string const& typed)
{
    std::size_t const sign = typed.find_last_not_of("0123456789");
    if (sign == std::string::npos || (typed[sign] != '~' && typed[sign] != '^')) {
        return std::nullopt;
    }
    std::string const digits = typed.substr(sign + 1);
    auto const count = digits.empty() ? std::optional<std::int64_t>(1) : numberIn(digits);
    return count ? std::optional(Step{typed.substr(0, sign), typed[sign], *count}) : std::nullopt;
}

std::optional<CommitRecord> goBack(CommitTables const& commits, CommitRecord commit, std::int64_t count)
{
    std::optional<CommitRecord> at = std::move(commit);
    for (; at && count > 0; --count) {
        at = firstParent(commits, *at);
    }
    return at;
}

std::optional<CommitRecord> parentOf(CommitTables const& commits, CommitRecord const& commit, std::int64_t number)
{
    if (number == 0) {
        return commit;
    }
    auto const index = static_cast<std::size_t>(number - 1);
    return index < commit.parents.size() ? commits.find(commit.parents[index]) : std::nullopt;
}

CommitRecord taken(Step const& step, CommitTables const& commits, CommitRecord const& commit)
{
    auto found = step.kind == '~' ? goBack(commits, commit, step.count) : parentOf(commits, commit, step.count);
    if (found) {
        return std::move(*found);
    }
    std::string const number = std::to_string(commit.number);
    std::string const count = std::to_string(step.count);
    throw Failure(
        step.kind == '~'
            ? "Fewer than " + count + " commits come before commit " + number + "."
            : "Commit " + number + " has fewer than " + count + (step.count == 1 ? " parent." : " parents."),
        kSeeLog);
}

} // namespace

std::optional<CommitRecord> findCommitIfAny(LocalDatabase const& database, std::string const& typed)
{
    std::vector<Step> steps; // The last one first.
    std::string start = typed;
    while (!findByReference(database.commits(), start)) {
        auto step = lastStep(start);
        if (!step) {
            break;
        }
        start = step->front;
        steps.push_back(std::move(*step));
    }
    auto commit = findStart(database, start);
    for (auto step = steps.rbegin(); commit && step != steps.rend(); ++step) {
        commit = taken(*step, database.commits(), *commit);
    }
    return commit;
}

CommitRecord findCommit(LocalDatabase const& database, std::string const& typed)
{
    if (auto commit = findCommitIfAny(database, typed)) {
        return std::move(*commit);
    }
    if (typed.empty() || database.commits().lastNumber() == 0) {
        throw Failure("There is no commit yet.", "Make the first one with 'tav add --all' and 'tav commit'.");
    }
    throw Failure("There is no commit, branch or tag '" + typed + "'.", kSeeAll);
}

} // namespace tav
