#include "common/mu_common_pattern.h"

#include <gtest/gtest.h>
#include <random>
#include <regex>
#include <string>
#include <vector>

namespace {

using common::CharacterRow;
using common::NameFilter;

OdString toWide(std::string const& bytes)
{
    return {bytes.data(), bytes.size(), CP_UTF_8};
}

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
        static_cast<void>(common::compilePattern(toWide(expression)));
    } catch (std::regex_error const&) {
        return false;
    }
    return true;
}

// A million names, each with one of two thousand expressions.
TEST(NameFilter, DecidesAsTheExpressionDoes)
{
    Dice dice(20240308);
    int rows = 0;
    for (int valid = 0; valid < 2000;) {
        std::string const expression = rule(dice);
        if (!isValid(expression)) {
            continue;
        }
        ++valid;
        rows += CharacterRow::of(expression) ? 1 : 0;
        NameFilter const filter(std::vector<OdString>{toWide(expression)});
        std::regex const compiled = common::compilePattern(toWide(expression));
        for (int i = 0; i < 500; ++i) {
            std::string const text = name(dice);
            ASSERT_EQ(filter.matches(text), std::regex_match(text, compiled)) << expression << " on " << text;
        }
    }
    EXPECT_GT(rows, 500); // Otherwise little is compared.
}

TEST(NameFilter, DecidesOnLongRowsAsTheExpressionDoes)
{
    for (std::size_t const length : {61U, 62U, 63U, 64U, 65U}) {
        std::string const digits(length, '7');
        std::string expression;
        for (std::size_t i = 0; i < length; ++i) {
            expression += "[0-9]";
        }
        NameFilter const filter(std::vector<OdString>{toWide(expression)});
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

} // namespace
