// Documents nested deeper than calls could follow on a small stack, however little each needs.
#include "tests/json/documents.h"
#include "tests/support/rows.h"
#include "tests/support/small_stack.h"

#include <gtest/gtest.h>
#include <utility>

namespace {

using namespace documents;
using kutils::json::write_string;
using support::onSmallStack;

constexpr std::size_t kDepth = 30'000;

struct Row {
    char const* name;
    std::wstring open;  ///< what leads one step down
    std::wstring inner; ///< what stands at the bottom
    std::wstring close; ///< what leads one step up
};

/// One document, `GetParam()` nested in itself; each operation runs on a small stack.
class JsonDepth : public testing::TestWithParam<Row> {
protected:
    static std::wstring documentWith(std::wstring const& inner)
    {
        Row const& row = GetParam();
        std::size_t const steps = kDepth / row.close.size();
        return repeat(row.open, steps) + inner + repeat(row.close, steps);
    }

    static std::wstring document() { return documentWith(GetParam().inner); }
};

INSTANTIATE_TEST_SUITE_P(
    Nested, JsonDepth,
    testing::Values(
        Row{"Arrays", L"[", L"1", L"]"}, Row{"Objects", L"{\"a\":", L"1", L"}"},
        Row{"ArraysAndObjects", L"[{\"a\":", L"1", L"}]"}, Row{"ArraysThatAreFirst", L"[", L"1", L",2]"},
        Row{"ArraysThatAreLast", L"[2,", L"1", L"]"}, Row{"ObjectsThatAreFirst", L"{\"a\":", L"1", L",\"b\":2}"},
        Row{"ObjectsThatAreLast", L"{\"a\":2,\"b\":", L"1", L"}"},
        Row{"ArraysBetweenContainers", L"[[],{},", L"1", L",[],{}]"},
        Row{"ObjectsBetweenContainers", L"{\"a\":[],\"b\":", L"1", L",\"c\":{}}"}),
    support::rowName);

TEST_P(JsonDepth, IsReadAndDestroyed)
{
    std::wstring const text = document();
    bool isRead = false;
    onSmallStack([&] { isRead = reads(text); });
    EXPECT_TRUE(isRead);
}

TEST_P(JsonDepth, IsRefusedAtTheBottom)
{
    std::wstring const text = documentWith(L"?");
    bool isRead = true;
    onSmallStack([&] { isRead = reads(text); });
    EXPECT_FALSE(isRead);
}

TEST_P(JsonDepth, IsRefusedWhenCutOff)
{
    std::wstring const whole = document();
    bool isRead = false;
    onSmallStack(
        [&] { isRead = reads(whole.substr(0, whole.size() / 2)) || reads(whole.substr(0, whole.size() - 1)); });
    EXPECT_FALSE(isRead);
}

TEST_P(JsonDepth, IsWrittenCompact)
{
    std::wstring const text = document();
    std::wstring written;
    onSmallStack([&] { written = write_string(read(text), false); });
    EXPECT_TRUE(written == text) << "the text is too long to show";
}

TEST_P(JsonDepth, IsCopiedAndCompared)
{
    Value value;
    ASSERT_TRUE(reads(document(), value));
    bool isEqual = false;
    onSmallStack([&] {
        Value const copy = value;
        isEqual = copy == value;
    });
    EXPECT_TRUE(isEqual);
}

TEST_P(JsonDepth, IsUnequalWhenTheBottomDiffers)
{
    Value value;
    Value other;
    ASSERT_TRUE(reads(document(), value));
    ASSERT_TRUE(reads(documentWith(L"3"), other));
    bool isEqual = true;
    onSmallStack([&] { isEqual = value == other || !(value != other); });
    EXPECT_FALSE(isEqual);
}

TEST_P(JsonDepth, IsAssigned)
{
    Value value;
    ASSERT_TRUE(reads(document(), value));
    Value source = value;
    bool isEqual = false;
    onSmallStack([&] {
        Value target;
        ASSERT_TRUE(reads(documentWith(L"[true]"), target));
        target = source;
        target = source;
        isEqual = target == value;
        target = std::move(source);
        isEqual = isEqual && target == value && source == Value();
    });
    EXPECT_TRUE(isEqual);
}

TEST_P(JsonDepth, IsReplacedByALaterMemberWithTheSameKey)
{
    std::wstring const text = L"{\"x\":" + document() + L",\"x\":1}";
    bool isReplaced = false;
    onSmallStack([&] { isReplaced = read(text) == Value(Object{{L"x", 1}}); });
    EXPECT_TRUE(isReplaced);
}

TEST(JsonDepthOf, AnOpenDocumentIsRefused)
{
    for (wchar_t const* const open : {L"[", L"{\"a\":", L"[{\"a\":", L"[[],", L"{\"a\":{},\"b\":"}) {
        std::wstring const text = repeat(open, kDepth);
        bool isRead = true;
        onSmallStack([&] { isRead = reads(text); });
        EXPECT_FALSE(isRead) << testing::PrintToString(open);
    }
}

TEST(JsonDepthOf, TakesAPartOfItself)
{
    Value value;
    ASSERT_TRUE(reads(repeat(L"[", kDepth) + repeat(L"]", kDepth), value));
    bool isEqual = false;
    onSmallStack([&] {
        Value expected = value.get_array()[0].get_array()[0];
        value = value.get_array()[0];
        value = std::move(value.get_array()[0]);
        isEqual = value == expected;
    });
    EXPECT_TRUE(isEqual);
}

TEST(JsonDepthOf, UnwrapsItselfToTheBottom)
{
    Value value;
    ASSERT_TRUE(reads(repeat(L"[", kDepth) + L"1" + repeat(L"]", kDepth), value));
    onSmallStack([&] {
        while (value.type() == Value_type::array) {
            value = std::move(value.get_array()[0]);
        }
    });
    EXPECT_EQ(value, Value(1));
}

TEST(JsonDepthOf, IsBuiltFromTheBottom)
{
    Value value;
    onSmallStack([&] {
        for (std::size_t i = 0; i < kDepth; ++i) {
            Array array;
            array.push_back(std::move(value));
            value = std::move(array);
        }
    });
    std::wstring text;
    onSmallStack([&] { text = write_string(value, false); });
    EXPECT_TRUE(text == repeat(L"[", kDepth) + L"null" + repeat(L"]", kDepth)) << "the text is too long to show";
}

TEST(JsonDepthOf, BareContainersAreCopiedAndDestroyed)
{
    Value array;
    Value object;
    ASSERT_TRUE(reads(repeat(L"[", kDepth) + repeat(L"]", kDepth), array));
    ASSERT_TRUE(reads(repeat(L"{\"a\":", kDepth) + L"1" + repeat(L"}", kDepth), object));
    bool isEqual = false;
    onSmallStack([&] {
        Array const arrayCopy = array.get_array();
        Object const objectCopy = object.get_object();
        Value const arrayAgain = arrayCopy;
        Value const objectAgain = objectCopy;
        isEqual = arrayAgain == array && objectAgain == object;
        Object both = {{L"a", arrayCopy}, {L"b", objectCopy}};
        both.erase(L"a");
    });
    EXPECT_TRUE(isEqual);
}

} // namespace
