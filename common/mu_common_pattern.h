/// Regular expressions that are safe to take from files and users. Internal to the library.
#pragma once

#include "platform/sdk/OdString.h"

#include <regex>
#include <string>
#include <string_view>
#include <vector>

namespace common {

/// Compiles `expression`, in the ECMAScript grammar, case-sensitive, over the bytes of its narrow form and under the
/// classic locale whatever the process's is.
/// The standard library's matcher recurses for every character and may try exponentially many ways, so expressions are
/// compiled for its polynomial algorithm, which does neither. Back references, which that algorithm lacks, are allowed
/// where few ways exist. Throws `std::regex_error` for an invalid expression and for one that is too deep or too large.
std::regex compilePattern(OdString const& expression);

/// Whether `expression` covers the whole of `text`. Throws `std::regex_error` when a back reference would have to be
/// followed through a text too long for it.
bool matchesWhole(std::regex const& expression, std::string const& text);

/// Names to leave out of a scan. A large folder asks for every name, so rules of the common shapes (a fixed name, a
/// fixed ending, beginning or middle) are decided without running their expression, wherever the answer is the same.
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
    };

    static Rule ruleOf(OdString const& text);
    static bool matchesPlain(Rule const& rule, std::string_view name);

    std::vector<Rule> rules_;
};

} // namespace common
