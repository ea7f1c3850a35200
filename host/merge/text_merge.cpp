#include "host/merge/text_merge.h"

#include <dtl/dtl.hpp>

#include <algorithm>
#include <cstddef>
#include <string_view>
#include <utility>
#include <vector>

namespace tav {

namespace {

constexpr std::size_t kLongest = std::size_t{1} << 20;
constexpr std::size_t kMostLines = 50'000;
constexpr std::size_t kSearchedForNul = 8'000;

using Lines = std::vector<std::string>;

/// With their ends: a last line without one differs from the same line with one.
Lines linesOf(std::string_view text)
{
    Lines lines;
    while (!text.empty()) {
        std::size_t const end = std::min(text.find('\n'), text.size() - 1) + 1;
        lines.emplace_back(text.substr(0, end));
        text.remove_prefix(end);
    }
    return lines;
}

enum class LineEnds { none, lf, crLf, mixed };

LineEnds lineEndsOf(std::string const& text)
{
    std::size_t lf = 0;
    std::size_t crLf = 0;
    for (std::size_t i = text.find('\n'); i != std::string::npos; i = text.find('\n', i + 1)) {
        ++(i > 0 && text[i - 1] == '\r' ? crLf : lf);
    }
    if (lf > 0 && crLf > 0) {
        return LineEnds::mixed;
    }
    return lf > 0 ? LineEnds::lf : crLf > 0 ? LineEnds::crLf : LineEnds::none;
}

bool isMergedByLines(std::string const& text)
{
    return text.size() <= kLongest && text.find('\0') >= std::min(kSearchedForNul, text.size()) &&
           static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n')) <= kMostLines;
}

bool haveSameLineEnds(std::initializer_list<LineEnds> all)
{
    LineEnds known = LineEnds::none;
    for (LineEnds const ends : all) {
        if (ends == LineEnds::mixed || (ends != LineEnds::none && known != LineEnds::none && ends != known)) {
            return false;
        }
        known = ends == LineEnds::none ? known : ends;
    }
    return true;
}

/// Lines of base, from `first` to before `last`, and what a side has in their place.
struct Change {
    std::size_t first;
    std::size_t last;
    Lines lines;
};

bool operator==(Change const& a, Change const& b)
{
    return a.first == b.first && a.last == b.last && a.lines == b.lines;
}

std::vector<Change> changesOf(Lines const& base, Lines const& side)
{
    dtl::Diff<std::string> diff(base, side);
    diff.compose();
    std::vector<Change> changes;
    std::size_t place = 0;
    bool isOpen = false;
    for (auto const& [line, info] : diff.getSes().getSequence()) {
        if (info.type == dtl::SES_COMMON) {
            ++place;
            isOpen = false;
            continue;
        }
        if (!isOpen) {
            changes.push_back({place, place, {}});
            isOpen = true;
        }
        if (info.type == dtl::SES_DELETE) {
            changes.back().last = ++place;
        } else {
            changes.back().lines.push_back(line);
        }
    }
    return changes;
}

/// All changes in the order of base; none when two of them touch.
std::optional<std::vector<Change>> joined(std::vector<Change> mine, std::vector<Change> theirs)
{
    std::vector<Change> all;
    std::merge(
        std::make_move_iterator(mine.begin()), std::make_move_iterator(mine.end()),
        std::make_move_iterator(theirs.begin()), std::make_move_iterator(theirs.end()), std::back_inserter(all),
        [](Change const& a, Change const& b) { return a.first < b.first; });
    all.erase(std::unique(all.begin(), all.end()), all.end());
    auto const touches = [](Change const& a, Change const& b) { return a.last >= b.first; };
    if (std::adjacent_find(all.begin(), all.end(), touches) != all.end()) {
        return std::nullopt;
    }
    return all;
}

std::string applied(std::vector<Change> const& changes, Lines const& base)
{
    std::string text;
    std::size_t place = 0;
    auto const copyUpTo = [&](std::size_t end) {
        for (; place < end; ++place) {
            text += base[place];
        }
    };
    for (Change const& change : changes) {
        copyUpTo(change.first);
        for (std::string const& line : change.lines) {
            text += line;
        }
        place = change.last;
    }
    copyUpTo(base.size());
    return text;
}

} // namespace

std::optional<std::string> mergeLines(std::string const& base, std::string const& mine, std::string const& theirs)
{
    bool const areTexts = isMergedByLines(base) && isMergedByLines(mine) && isMergedByLines(theirs);
    if (!areTexts || !haveSameLineEnds({lineEndsOf(base), lineEndsOf(mine), lineEndsOf(theirs)})) {
        return std::nullopt;
    }
    Lines const lines = linesOf(base);
    std::optional<std::vector<Change>> const changes =
        joined(changesOf(lines, linesOf(mine)), changesOf(lines, linesOf(theirs)));
    return changes ? std::make_optional(applied(*changes, lines)) : std::nullopt;
}

} // namespace tav
