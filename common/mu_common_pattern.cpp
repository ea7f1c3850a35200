#include "common/mu_common_pattern.h"

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

// An expression of this many states compiles and matches within some 520 KiB of stack (measured with libstdc++ 12) and
// takes some milliseconds for a file name at worst. Lists of names are far smaller.
constexpr std::size_t kMaxStates = 4000;
constexpr std::size_t kMaxDigitsOfBackReference = 4; // The standard library lets large numbers overflow.
// A look-ahead starts a match of its own at every character, one inside another multiplies that once more.
constexpr std::size_t kMaxStatesWithLookAhead = 400;
// One level of nesting takes some 850 bytes of stack to compile.
constexpr std::size_t kMaxDepth = 100;
// Following back references costs a level of recursion for every character.
constexpr std::size_t kMaxTextWithBackReference = 1024;
constexpr int kMaxQuantifiersWithBackReference = 2;
// Each alternative may double the ways, quantified or not.
constexpr int kMaxAlternativesWithBackReference = 4;

#if defined(__GLIBCXX__)
// Breadth-first matching over the automaton: a documented extension of libstdc++.
constexpr auto kPolynomial = std::regex::ECMAScript | std::regex::nosubs | std::regex_constants::__polynomial;
#else
constexpr auto kPolynomial = std::regex::ECMAScript | std::regex::nosubs;
#endif

[[noreturn]] void refuse()
{
    throw std::regex_error(std::regex_constants::error_complexity);
}

/// Measures an expression before the standard library sees it: its compiler is recursive too.
/// Syntax is not checked here, only counted; what is wrong in it the compiler says.
class Survey {
public:
    explicit Survey(std::string_view expression) : rest_(expression)
    {
        while (!rest_.empty()) {
            step();
            if (states_ > (lookAhead_ ? kMaxStatesWithLookAhead : kMaxStates)) {
                refuse();
            }
        }
    }

    bool hasBackReference() const { return backReference_; }

    /// Whether trying all ways takes polynomially many steps of a low degree.
    bool hasFewWays() const
    {
        return !quantifiedGroup_ && !lookAhead_ && quantifiers_ <= kMaxQuantifiersWithBackReference &&
               alternatives_ <= kMaxAlternativesWithBackReference;
    }

private:
    enum class Last { other, group, quantifier };

    struct Group {
        std::size_t statesBefore;
        bool isLookAhead;
    };

    void step()
    {
        switch (rest_.front()) {
        case '\\': escape(); break;
        case '[': bracket(); break;
        case '(': openGroup(); break;
        case ')': closeGroup(); break;
        case '*':
        case '+':
        case '?': quantify(0, 1); break;
        case '{': braces(); break;
        case '|': alternative(); break;
        default: atom(1); break;
        }
    }

    void atom(std::size_t length)
    {
        rest_.remove_prefix(std::min(length, rest_.size()));
        atomStates_ = length;
        states_ += length;
        last_ = Last::other;
    }

    void alternative()
    {
        ++alternatives_;
        atom(1);
    }

    void escape()
    {
        bool const isDigit = rest_.size() > 1 && rest_[1] >= '1' && rest_[1] <= '9';
        backReference_ = backReference_ || isDigit;
        std::size_t const end = std::min(rest_.find_first_not_of("0123456789", 1), rest_.size());
        if (isDigit && end - 1 > kMaxDigitsOfBackReference) {
            refuse();
        }
        atom(2);
        last_ = isDigit ? Last::group : Last::other;
    }

    void bracket()
    {
        std::size_t end = 1;
        while (end < rest_.size() && rest_[end] != ']') {
            end += rest_[end] == '\\' ? 2 : 1;
        }
        atom(std::min(end + 1, rest_.size()));
    }

    void openGroup()
    {
        bool const isLookAhead = rest_.substr(0, 3) == "(?=" || rest_.substr(0, 3) == "(?!";
        if (groups_.size() == kMaxDepth || (isLookAhead && insideLookAhead_)) {
            refuse();
        }
        lookAhead_ = lookAhead_ || isLookAhead;
        insideLookAhead_ = insideLookAhead_ || isLookAhead;
        groups_.push_back({states_, isLookAhead});
        atom(rest_.substr(0, 2) == "(?" ? 3 : 1);
    }

    void closeGroup()
    {
        atom(1);
        if (groups_.empty()) {
            return;
        }
        atomStates_ = states_ - groups_.back().statesBefore;
        insideLookAhead_ = insideLookAhead_ && !groups_.back().isLookAhead;
        groups_.pop_back();
        last_ = Last::group;
    }

    /// `{2}`, `{2,}` and `{2,5}` repeat what stands before them in the automaton as often as the larger number says.
    void braces()
    {
        std::size_t const end = std::min(rest_.find('}'), rest_.size() - 1);
        std::size_t number = 0;
        std::size_t largest = 1;
        for (char const c : rest_.substr(1, end)) {
            number = c >= '0' && c <= '9'
                         ? std::min<std::size_t>(number * 10 + static_cast<std::size_t>(c - '0'), kMaxStates)
                         : 0;
            largest = std::max(largest, number);
        }
        quantify(largest, end + 1);
    }

    /// The automaton gets as many `copies` of what is repeated, besides the original; loops need none.
    void quantify(std::size_t copies, std::size_t length)
    {
        bool const isLazyMark = last_ == Last::quantifier && rest_.front() == '?' && !lazy_;
        quantifiedGroup_ = quantifiedGroup_ || (last_ != Last::other && !isLazyMark);
        quantifiers_ += isLazyMark ? 0 : 1;
        lazy_ = isLazyMark;
        std::size_t const original = atomStates_;
        atom(length);
        states_ += original * copies;
        atomStates_ = original * std::max<std::size_t>(copies, 1) + length;
        last_ = Last::quantifier;
    }

    std::string_view rest_;
    std::vector<Group> groups_;
    std::size_t states_ = 0;
    std::size_t atomStates_ = 0;
    int quantifiers_ = 0;
    int alternatives_ = 0;
    Last last_ = Last::other;
    bool lazy_ = false;
    bool insideLookAhead_ = false;
    bool lookAhead_ = false;
    bool backReference_ = false;
    bool quantifiedGroup_ = false;
};

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

std::regex compilePattern(OdString const& expression)
{
    std::string const narrow = expression.ansi_str();
    Survey const survey(narrow);
    if (!survey.hasBackReference()) {
        return compile(narrow, kPolynomial);
    }
    if (!survey.hasFewWays()) {
        refuse();
    }
    return compile(narrow, std::regex::ECMAScript);
}

bool matchesWhole(std::regex const& expression, std::string const& text)
{
    bool const recurses = (expression.flags() & kPolynomial) != kPolynomial;
    if (recurses && text.size() > kMaxTextWithBackReference) {
        refuse();
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
    rule.expression = compilePattern(text);
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
