#include "common/mu_common_expression_ways.h"
#include "common/mu_common_pattern.h"
#include "tests/support/utf8.h"

#include <cstddef>
#include <gtest/gtest.h>
#include <iterator>
#include <random>
#include <regex>
#include <string>
#include <vector>

namespace {

using common::CharacterRow;
using common::NameFilter;

class Dice {
public:
    explicit Dice(unsigned seed) : random_(seed) {}

    std::size_t upTo(std::size_t most) { return std::uniform_int_distribution<std::size_t>(0, most)(random_); }

    template <std::size_t N>
    std::string oneOf(char const* const (&texts)[N])
    {
        return texts[upTo(N - 1)];
    }

private:
    std::mt19937 random_;
};

/// Rows of characters, mostly; what stands in an expression otherwise is strewn in.
std::string rule(Dice& dice)
{
    static constexpr char const* kStarts[] = {"", "^", "^.*", ".*", "^^"};
    static constexpr char const* kEnds[] = {"", "$", ".*$", ".*", "\\$", "\\\\$", "$$"};
    static constexpr char const* kCharacters[] = {
        "a",     "b",    "A",    "1",  "_",   ".",   "\\.", "-",    "\xC3",        "[ab]",  "[a-b]", "[A-b]", "[0-9]",
        "[1a_]", "[^a]", "[a-]", "[]", "\\d", "(a)", "a|b", "\\\\", "[[:alpha:]]", "(?=a)", "\\-",   "/",     "[.]"};
    static constexpr char const* kQuantifiers[] = {"", "", "", "*", "+", "?", "*?", "{2}"};
    std::string text = dice.oneOf(kStarts);
    for (std::size_t left = dice.upTo(5); left > 0; --left) {
        bool const isCommon = dice.upTo(7) > 0;
        text += isCommon ? kCharacters[dice.upTo(13)] : dice.oneOf(kCharacters);
        text += dice.oneOf(kQuantifiers);
    }
    return text + dice.oneOf(kEnds);
}

std::string name(Dice& dice)
{
    static constexpr char kCharacters[] = "aaaabbbA1_.-\\$^\n\r\xC3[";
    std::string text(dice.upTo(7), ' ');
    for (char& c : text) {
        c = kCharacters[dice.upTo(sizeof kCharacters - 2)];
    }
    return text;
}

bool isValid(std::string const& expression)
{
    try {
        static_cast<void>(common::compilePattern(support::fromUtf8(expression), common::kLongestName));
    } catch (std::regex_error const&) {
        return false;
    }
    return true;
}

// A hundred thousand names, each with one of a thousand expressions.
TEST(NameFilter, DecidesAsTheExpressionDoes)
{
    Dice dice(20240308);
    int rows = 0;
    for (int valid = 0; valid < 1000;) {
        std::string const expression = rule(dice);
        if (!isValid(expression)) {
            continue;
        }
        ++valid;
        rows += CharacterRow::of(expression) ? 1 : 0;
        NameFilter const filter(std::vector<OdString>{support::fromUtf8(expression)});
        std::regex const compiled = common::compilePattern(support::fromUtf8(expression), common::kLongestName);
        for (int i = 0; i < 100; ++i) {
            std::string const text = name(dice);
            ASSERT_EQ(filter.matches(text), std::regex_match(text, compiled)) << expression << " on " << text;
        }
    }
    EXPECT_GT(rows, 250); // Otherwise little is compared.
}

TEST(NameFilter, DecidesOnLongRowsAsTheExpressionDoes)
{
    for (std::size_t const length : {61U, 62U, 63U, 64U, 65U}) {
        std::string const digits(length, '7');
        std::string expression;
        for (std::size_t i = 0; i < length; ++i) {
            expression += "[0-9]";
        }
        NameFilter const filter(std::vector<OdString>{support::fromUtf8(expression)});
        EXPECT_TRUE(filter.matches(digits)) << length;
        EXPECT_FALSE(filter.matches(digits + "7")) << length;
        EXPECT_FALSE(filter.matches(digits.substr(1))) << length;
    }
}

TEST(CharacterRow, IsNoneOfOtherForms)
{
    for (char const* expression :
         {"(a)", "a|b", "a{2}", "a*?", "\\d", "[^a]", "[[:alpha:]]", "[a", "[a-]", "a\\", "^^a"}) {
        EXPECT_EQ(CharacterRow::of(expression), nullptr) << expression;
    }
}

TEST(CharacterRow, IsAnIgnoreRuleOfTheUsualKind)
{
    for (char const* expression : {R"(^.*\.[bB][aA][kK]$)", R"(^plot-[0-9]+\.log$)", R"(.*\.sv[0-9]?)"}) {
        EXPECT_NE(CharacterRow::of(expression), nullptr) << expression;
    }
}

/// Expressions with back references, loops in loops and choices of every kind.
class BackReferences {
public:
    std::string next() { return "(a|b)" + alternatives(2) + "\\1" + sequence(1); }

private:
    std::string alternatives(int depth)
    {
        std::string const text = sequence(depth);
        return dice_.upTo(3) > 0 ? text : text + "|" + sequence(depth);
    }

    std::string sequence(int depth)
    {
        std::string text;
        for (std::size_t left = dice_.upTo(3); left > 0; --left) {
            text += term(depth);
        }
        return text;
    }

    std::string term(int depth)
    {
        static constexpr char const* kAtoms[] = {
            "a",  "b",   "c", ".", "[ab]", "[bc]",   "[^a]", "\\w",  "(a|b)", "(|a)",   "(a*)",    "(.*)",
            "()", "\\b", "^", "$", "\\1",  "(ab|a)", "c",    "(b+)", "c",     "(?:ab)", "(?=.*b)", "(?!a*c)"};
        static constexpr char const* kGroups[] = {"(", "(?:", "(", "(?=", "(?!"};
        static constexpr char const* kQuantifiers[] = {"*", "+", "?", "*?", "{2}", "{0,2}", "{1,3}?", "{2,}", "{0,40}"};
        bool const isGroup = depth > 0 && dice_.upTo(2) == 0;
        std::string const text = isGroup ? dice_.oneOf(kGroups) + alternatives(depth - 1) + ")" : dice_.oneOf(kAtoms);
        return dice_.upTo(2) == 0 ? text + dice_.oneOf(kQuantifiers) : text;
    }

    Dice dice_{20240309};
};

/// Counts how often a text is looked at.
class Looks {
public:
    using iterator_category = std::bidirectional_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = char const*;
    using reference = char const&;

    Looks() = default;
    Looks(char const* at, double& count) : at_(at), count_(&count) {}

    reference operator*() const { return ++*count_, *at_; }
    Looks& operator++() { return ++at_, *this; }
    Looks& operator--() { return --at_, *this; }
    Looks operator++(int) { return {at_++, *count_}; }
    Looks operator--(int) { return {at_--, *count_}; }
    bool operator==(Looks const& other) const { return at_ == other.at_; }
    bool operator!=(Looks const& other) const { return at_ != other.at_; }

private:
    char const* at_ = nullptr;
    double* count_ = nullptr;
};

double looksOfMatching(std::string const& text, std::regex const& compiled)
{
    double count = 0;
    std::regex_match(Looks(text.data(), count), Looks(text.data() + text.size(), count), compiled);
    return count;
}

std::vector<std::string> textsOfManyWays(std::size_t length)
{
    std::vector<std::string> texts;
    for (std::string const part : {"a", "b", "ab", "aab", "abb", "abc"}) {
        std::string text = part;
        while (text.size() < length) {
            text += part;
        }
        texts.push_back(text.substr(0, length));
        texts.push_back(text.substr(0, length - 1) + "d");
    }
    return texts;
}

// A back reference is compared character by character, so one step may look at the whole text.
TEST(StepsWayByWay, AreNeverMoreThanForeseen)
{
    constexpr std::size_t kLength = 24;
    std::vector<std::string> const texts = textsOfManyWays(kLength);
    BackReferences expressions;
    int accepted = 0;
    for (int i = 0; i < 1500; ++i) {
        std::string const expression = expressions.next();
        if (!isValid(expression)) {
            continue;
        }
        ++accepted;
        std::regex const compiled = common::compilePattern(support::fromUtf8(expression), kLength);
        double const foreseen = common::stepsWayByWay(common::readExpression(expression), kLength, 0);
        for (std::string const& text : texts) {
            ASSERT_LE(looksOfMatching(text, compiled), foreseen * kLength) << expression << " on " << text;
        }
    }
    EXPECT_GT(accepted, 200); // Otherwise little is tried.
}

} // namespace
