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
/// classic locale whatever the process's is.
/// The standard library's matcher recurses for every character and may try exponentially many ways. Expressions are
/// compiled without sub-matches for its polynomial algorithm, which does neither. Back references, which that algorithm
/// lacks, are followed one way after the other. Throws `std::regex_error` for an invalid expression, and for one that
/// could take too much stack, memory or time with a text of `longestText` characters (see `checkCompiling` and others).
std::regex compilePattern(OdString const& expression, std::size_t longestText);

/// Whether `expression` covers the whole of `text`. Throws `std::regex_error` when a back reference would have to be
/// followed through a text of more than `kLongestText` characters.
bool matchesWhole(std::regex const& expression, std::string const& text);

/// An expression that is one row of single characters, each of them `.`, a class like `[a-c_]` or itself, and each at
/// will with `*`, `+` or `?`. All ways to match are followed at once, one bit for each character of the row, which
/// takes a fiftieth of the time of the standard library's matcher.
class CharacterRow {
public:
    /// Null for an expression of another form, and for one that is too long.
    static std::unique_ptr<CharacterRow const> of(std::string_view expression);

    /// Whether the row covers the whole of `text`, which holds no line end.
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

/// Names to leave out of a scan. A large folder asks for every name, so rules of the common shapes (a fixed name, a
/// fixed ending, beginning or middle, a row of characters) are decided without running their expression, wherever the
/// answer is the same.
class NameFilter {
public:
    /// Compiles `rules` as `compilePattern` does.
    explicit NameFilter(std::vector<OdString> const& rules);
    /// Takes expressions as they are and runs them.
    explicit NameFilter(std::vector<std::regex> const& expressions);

    bool isEmpty() const { return rules_.empty(); }
    /// Whether any rule covers the whole of `name`, which is in its narrow form.
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
