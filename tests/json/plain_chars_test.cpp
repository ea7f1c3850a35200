#include "json/json_writer.h"

#include <clocale>
#include <gtest/gtest.h>
#include <string>

namespace {

using kutils::json::detail::Plain_chars;

TEST(JsonPlainChars, AreThoseOfAsciiThatArePrintableAndNeedNoEscape)
{
    Plain_chars const plain;
    for (wchar_t c = 0; c < 128; ++c) {
        bool const isPlain = c >= L' ' && c <= L'~' && c != L'"' && c != L'\\';
        EXPECT_EQ(plain.contains(c), isPlain) << static_cast<int>(c);
    }
}

TEST(JsonPlainChars, FollowTheLocaleOfTheMomentBeyondAscii)
{
    Plain_chars const plain;
    EXPECT_FALSE(plain.contains(L'\u00E4'));
    std::string const before = std::setlocale(LC_ALL, nullptr);
    ASSERT_NE(std::setlocale(LC_ALL, "C.UTF-8"), nullptr);
    EXPECT_TRUE(plain.contains(L'\u00E4'));
    std::setlocale(LC_ALL, before.c_str());
    EXPECT_FALSE(plain.contains(L'\u00E4'));
}

} // namespace
