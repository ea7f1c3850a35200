/// Regular expressions that are safe to take from files and users. Internal to the library.
#pragma once

#include "common/mu_common_expression_cost.h"

#include "platform/sdk/OdString.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <regex>
#include <string>
#include <string_view>
#include <vector>

namespace common {

/// Compiles `expression`, in the ECMAScript grammar, case-sensitive, over the bytes of its narrow form and under the
/// classic locale, whatever the locale of the process.
/// The standard library's default matcher recurses for every character and may backtrack exponentially. Expressions are
/// therefore compiled without sub-matches for its polynomial algorithm, which does neither. That algorithm has no back
/// references; expressions that have them are matched with backtracking. Throws `std::regex_error` for an invalid
/// expression, and for one that could take too much stack, memory or time with a text of `longestText` characters (see
/// `checkCompiling` and others).
std::regex compilePattern(OdString const& expression, std::size_t longestText);

/// Whether `expression` matches the whole of `text`. Throws `std::regex_error` for an expression with a back reference
/// and a text of more than `kLongestText` characters.
bool matchesWhole(std::regex const& expression, std::string const& text);

/// An expression that is a sequence of single characters, each of them `.`, a class like `[a-c_]` or a literal,
/// optionally followed by `*`, `+` or `?`. A bit-parallel automaton follows all ways to match at once, with one bit for
/// each character of the sequence, which takes a fiftieth of the time of the standard library's matcher.
class CharacterRow {
public:
    /// Null for any other expression, and for one that is too long.
    static std::unique_ptr<CharacterRow const> of(std::string_view expression);

    /// Whether the sequence matches the whole of `text`, which must not contain a line end.
    bool matches(std::string_view text) const;

private:
    using Bits = std::uint64_t; // bit i: the first i characters of the row are behind

    bool read(std::string_view rest);
    bool readCharacter(std::string_view& rest);
    bool readClass(std::string_view& rest);
    void readQuantifier(std::string_view& rest);
    Bits skipOptional(Bits states) const;
    void admit(char c) { admitted_[static_cast<unsigned char>(c)] |= Bits{1} << (length_ + 1); }

    static constexpr unsigned kLongest = 62;

    std::array<Bits, 256> admitted_{}; // for each character, the states that it may lead to
    Bits repeated_ = 0;                // states that stay when their character comes again
    Bits optional_ = 0;                // states that are also reached without their character
    unsigned length_ = 0;
};

/// Names to leave out of a scan. A scan checks every name of a large folder, so rules of the common forms (a fixed
/// name, a fixed ending, beginning or middle, a sequence of characters) are decided without running their expression,
/// wherever the answer is the same.
class NameFilter {
public:
    /// Compiles `rules` as `compilePattern` does.
    explicit NameFilter(std::vector<OdString> const& rules);
    /// Uses compiled expressions and always runs them.
    explicit NameFilter(std::vector<std::regex> const& expressions);

    bool isEmpty() const { return rules_.empty(); }
    /// Whether any rule matches the whole of `name`, which is in its narrow form.
    bool matches(std::string const& name) const;

private:
    struct Rule {
        std::regex expression;
        bool isPlain = false; // anything before (if so), `literal`, anything after (if so)
        bool anyBefore = false;
        bool anyAfter = false;
        std::string literal;
        std::unique_ptr<CharacterRow const> row; // null when the expression is to be run
    };

    static Rule ruleOf(OdString const& text);
    static bool matchesPlain(Rule const& rule, std::string_view name);
    static bool matchesSimple(Rule const& rule, std::string const& name);

    std::vector<Rule> rules_;
};

} // namespace common
