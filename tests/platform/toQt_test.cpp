#include "platform/qut/toQt.h"

#include <gmock/gmock.h>

namespace {

std::u16string converted(std::wstring const& text)
{
    return qut::toQt(OdString(text.data(), text.size())).toStdU16String();
}

TEST(ToQt, ConvertsCharactersToUtf16)
{
    EXPECT_EQ(converted(L""), u"");
    EXPECT_EQ(converted(L"plan \u20AC \uFFFF"), u"plan \u20AC \uFFFF");
    EXPECT_EQ(converted(L"\U00010000\U0010FFFF"), u"\U00010000\U0010FFFF");
}

TEST(ToQt, KeepsAByteOrderMark)
{
    EXPECT_EQ(converted(L"\uFEFFx"), u"\uFEFFx");
}

TEST(ToQt, KeepsNuls)
{
    EXPECT_EQ(converted(std::wstring(L"a\0b", 3)), std::u16string(u"a\0b", 3));
}

TEST(ToQt, KeepsBytesOfFileNamesAsLoneSurrogates)
{
    EXPECT_EQ(converted({L'a', 0xDC80, 0xDCFF, L'b'}), (std::u16string{u'a', 0xDC80, 0xDCFF, u'b'}));
    EXPECT_EQ(converted({0xD800}), std::u16string(1, 0xD800));
}

TEST(ToQt, ReplacesWhatIsNoCharacter)
{
    EXPECT_EQ(converted({static_cast<wchar_t>(0x110000), static_cast<wchar_t>(-1)}), u"\uFFFD\uFFFD");
}

} // namespace
