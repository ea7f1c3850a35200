#include "common/mu_common_pattern.h"

#include "common/mu_common_expression.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <locale>
#include <numeric>
#include <string_view>
#include <utility>
#include <vector>

namespace common {

namespace {

#if defined(__GLIBCXX__)
// Breadth-first matching over the automaton: a documented extension of libstdc++.
constexpr auto kPolynomial = std::regex::ECMAScript | std::regex::nosubs | std::regex_constants::__polynomial;
#else
constexpr auto kPolynomial = std::regex::ECMAScript | std::regex::nosubs;
#endif

/// The standard library notes in the classic locale which characters it has been asked about, without any guard: what
/// it has been asked about all of them at once, it only reads.
void askAboutAllCharacters()
{
    static bool const isDone = [] {
        std::array<char, 256> characters{};
        std::iota(characters.begin(), characters.end(), '\0');
        std::array<char, 256> narrow{};
        auto const& type = std::use_facet<std::ctype<char>>(std::locale::classic());
        type.narrow(characters.data(), characters.data() + characters.size(), '\0', narrow.data());
        return true;
    }();
    static_cast<void>(isDone);
}

std::regex compile(std::string const& expression, std::regex::flag_type flags)
{
    askAboutAllCharacters();
    std::regex compiled;
    compiled.imbue(std::locale::classic());
    compiled.assign(expression, flags);
    return compiled;
}

bool startsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

bool endsWith(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

/// The text that an expression without operators stands for; false when it has operators.
bool readLiteral(std::string_view expression, std::string& literal)
{
    constexpr std::string_view kOperators = R"(\^$.*+?()[]{}|/)";
    for (std::size_t i = 0; i < expression.size(); ++i) {
        bool const isEscape = expression[i] == '\\' && i + 1 < expression.size();
        bool const isOperator = kOperators.find(expression[i + isEscape]) != kOperators.npos;
        if (isEscape != isOperator) {
            return false;
        }
        i += isEscape;
        literal += expression[i];
    }
    return true;
}

} // namespace

std::regex compilePattern(OdString const& expression, std::size_t longestText)
{
    std::string const narrow = expression.ansi_str();
    Expression const tree = readExpression(narrow);
    checkCompiling(tree);
    if (!contains(tree, Expression::Kind::backReference)) {
        checkMatchingAtOnce(tree, longestText);
        return compile(narrow, kPolynomial);
    }
    std::regex const compiled = compile(narrow, std::regex::ECMAScript);
    checkMatchingWayByWay(tree, longestText);
    return compiled;
}

bool matchesWhole(std::regex const& expression, std::string const& text)
{
    bool const recurses = (expression.flags() & kPolynomial) != kPolynomial;
    if (recurses && text.size() > kLongestText) {
        refuseExpression();
    }
    return std::regex_match(text, expression);
}

std::unique_ptr<CharacterRow const> CharacterRow::of(std::string_view expression)
{
    if (startsWith(expression, "^")) {
        expression.remove_prefix(1);
    }
    if (endsWith(expression, "$") && !endsWith(expression, R"(\$)")) {
        expression.remove_suffix(1);
    }
    auto row = std::make_unique<CharacterRow>();
    return row->read(expression) ? std::move(row) : nullptr;
}

bool CharacterRow::read(std::string_view rest)
{
    while (!rest.empty()) {
        if (length_ == kLongest || !readCharacter(rest)) {
            return false;
        }
        ++length_;
        readQuantifier(rest);
    }
    return true;
}

bool CharacterRow::readCharacter(std::string_view& rest)
{
    if (rest.front() == '[') {
        return readClass(rest);
    }
    bool const isEscape = rest.front() == '\\' && rest.size() > 1;
    std::string literal;
    if (rest.front() == '.') {
        for (Bits& states : admitted_) {
            states |= Bits{1} << (length_ + 1);
        }
    } else if (readLiteral(rest.substr(0, isEscape ? 2 : 1), literal)) {
        admit(literal.front());
    } else {
        return false;
    }
    rest.remove_prefix(isEscape ? 2 : 1);
    return true;
}

// Letters, digits, underscores, and ranges of them.
bool CharacterRow::readClass(std::string_view& rest)
{
    auto const isWord = [](char c) {
        return c == '_' || (c >= '0' && c <= '9') || ((c | 32) >= 'a' && (c | 32) <= 'z');
    };
    rest.remove_prefix(1);
    std::size_t const before = rest.size();
    while (!rest.empty() && isWord(rest.front())) {
        bool const isRange = rest.size() > 2 && rest[1] == '-' && isWord(rest[2]);
        for (char c = rest.front(); c <= rest[isRange ? 2 : 0]; ++c) {
            admit(c);
        }
        rest.remove_prefix(isRange ? 3 : 1);
    }
    bool const isWhole = before > rest.size() && !rest.empty() && rest.front() == ']';
    rest.remove_prefix(isWhole ? 1 : 0);
    return isWhole;
}

// A second one, as in `.*?`, stands where a character has to, and is none.
void CharacterRow::readQuantifier(std::string_view& rest)
{
    char const mark = rest.empty() ? '\0' : rest.front();
    if (mark != '*' && mark != '+' && mark != '?') {
        return;
    }
    Bits const state = Bits{1} << length_;
    repeated_ |= mark != '?' ? state : 0;
    optional_ |= mark != '+' ? state : 0;
    rest.remove_prefix(1);
}

CharacterRow::Bits CharacterRow::skipOptional(Bits states) const
{
    for (Bits more = states; more != 0; states |= more) {
        more = (more << 1) & optional_ & ~states;
    }
    return states;
}

bool CharacterRow::matches(std::string_view text) const
{
    Bits states = skipOptional(1);
    for (char const c : text) {
        Bits const reached = ((states << 1) | (states & repeated_)) & admitted_[static_cast<unsigned char>(c)];
        if (reached == 0) {
            return false;
        }
        states = skipOptional(reached);
    }
    return (states >> length_ & 1) != 0;
}

NameFilter::NameFilter(std::vector<OdString> const& rules)
{
    for (OdString const& rule : rules) {
        rules_.push_back(ruleOf(rule));
    }
}

NameFilter::NameFilter(std::vector<std::regex> const& expressions)
{
    for (std::regex const& expression : expressions) {
        rules_.emplace_back().expression = expression;
    }
}

NameFilter::Rule NameFilter::ruleOf(OdString const& text)
{
    Rule rule;
    rule.expression = compilePattern(text, kLongestName);
    std::string const narrow = text.ansi_str();
    std::string_view rest = narrow;
    if (startsWith(rest, "^")) {
        rest.remove_prefix(1);
    }
    rule.anyBefore = startsWith(rest, ".*");
    rest.remove_prefix(rule.anyBefore ? 2 : 0);
    if (endsWith(rest, "$") && !endsWith(rest, R"(\$)")) {
        rest.remove_suffix(1);
    }
    rule.anyAfter = endsWith(rest, ".*") && !endsWith(rest, R"(\.*)");
    rest.remove_suffix(rule.anyAfter ? 2 : 0);
    rule.isPlain = readLiteral(rest, rule.literal);
    if (!rule.isPlain) {
        rule.row = CharacterRow::of(narrow);
    }
    return rule;
}

bool NameFilter::matchesPlain(Rule const& rule, std::string_view name)
{
    if (rule.anyBefore && rule.anyAfter) {
        return name.find(rule.literal) != name.npos;
    }
    if (rule.anyBefore) {
        return endsWith(name, rule.literal);
    }
    return rule.anyAfter ? startsWith(name, rule.literal) : name == rule.literal;
}

bool NameFilter::matchesSimple(Rule const& rule, std::string const& name)
{
    if (rule.isPlain) {
        return matchesPlain(rule, name);
    }
    return rule.row ? rule.row->matches(name) : matchesWhole(rule.expression, name);
}

bool NameFilter::matches(std::string const& name) const
{
    // `.` matches no line end, so a name that holds one is left to the expressions.
    bool const hasLineEnd = std::any_of(name.begin(), name.end(), [](char c) { return c == '\n' || c == '\r'; });
    return std::any_of(rules_.begin(), rules_.end(), [&](Rule const& rule) {
        return hasLineEnd ? matchesWhole(rule.expression, name) : matchesSimple(rule, name);
    });
}

} // namespace common
