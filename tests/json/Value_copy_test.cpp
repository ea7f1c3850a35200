// Copying, moving and destroying values: what becomes of the two sides, and of memory that runs out half-way.
#include "tests/json/documents.h"
#include "tests/support/allocations.h"

#include <gtest/gtest.h>
#include <memory>
#include <utility>

namespace {

using namespace documents;
using support::WatchedMemory;
using support::worksWithin;

/// Every kind of value, nested in each other, with texts too long to need no memory.
Value richValue()
{
    return read(
        LR"({"array":[null,true,-1,2,3.5,"a text of some length",[],{},[["deep"]]],)"
        LR"("a key of some length":{"inner":{"innermost":[1,{"x":"another text of some length"}]}},"z":"end"})");
}

TEST(JsonValueCopy, IsIndependent)
{
    Value const original = richValue();
    Value copy = original;
    EXPECT_EQ(copy, original);
    copy.get_object()[L"array"].get_array()[8].get_array()[0].get_array()[0] = L"changed";
    EXPECT_EQ(original, richValue());
    EXPECT_NE(copy, original);
}

TEST(JsonValueCopy, OutlivesTheOriginal)
{
    Value copy;
    {
        Value const original = richValue();
        copy = original;
    }
    EXPECT_EQ(copy, richValue());
}

TEST(JsonValueCopy, LeavesNothingBehindWhicheverAllocationFails)
{
    Value const original = richValue();
    long limit = 0;
    for (bool copied = false; !copied; ++limit) {
        WatchedMemory const memory;
        copied = worksWithin(limit, [&] { Value const copy = original; });
        ASSERT_EQ(memory.blocks(), 0) << "with " << limit << " requests";
    }
    EXPECT_GT(limit, 20) << "the value is too simple for this test";
}

TEST(JsonValueCopy, AssignmentChangesNothingWhicheverAllocationFails)
{
    Value const original = richValue();
    for (long limit = 0;; ++limit) {
        Value target = Array{L"a text that was there before"};
        if (worksWithin(limit, [&] { target = original; })) {
            EXPECT_EQ(target, original);
            return;
        }
        ASSERT_EQ(target, Value(Array{L"a text that was there before"})) << "with " << limit << " requests";
    }
}

TEST(JsonValueCopy, ReadingChangesNothingWhicheverAllocationFails)
{
    OdString const text(kutils::json::write_string(richValue(), true).c_str());
    for (long limit = 0;; ++limit) {
        Value target = L"before";
        bool read = false;
        WatchedMemory const memory;
        if (worksWithin(limit, [&] { read = read_string(target, text); })) {
            EXPECT_TRUE(read);
            EXPECT_EQ(target, richValue());
            return;
        }
        ASSERT_EQ(target, Value(L"before")) << "with " << limit << " requests";
        ASSERT_EQ(memory.blocks(), 0) << "with " << limit << " requests";
    }
}

TEST(JsonValueCopy, WritingPassesOnThatMemoryRanOut)
{
    Value const value = Array{std::wstring(100'000, L'\x0001'), richValue()};
    std::wstring const whole = kutils::json::write_string(value, true);
    for (long limit = 0;; ++limit) {
        WatchedMemory const memory;
        std::wstring text;
        if (worksWithin(limit, [&] { text = kutils::json::write_string(value, true); })) {
            EXPECT_EQ(text, whole);
            return;
        }
        ASSERT_EQ(memory.blocks(), 0) << "with " << limit << " requests";
    }
}

TEST(JsonValueCopy, DestroyingNeedsNoMemory)
{
    bool destroyed = false;
    {
        auto value = std::make_unique<Value>(richValue());
        destroyed = worksWithin(0, [&] { value.reset(); });
    }
    EXPECT_TRUE(destroyed);
}

TEST(JsonValueCopy, MovingNeedsNoMemory)
{
    Value source = richValue();
    Value target = richValue();
    EXPECT_TRUE(worksWithin(0, [&] { target = std::move(source); }));
    EXPECT_EQ(target, richValue());
}

TEST(JsonValueCopy, TakesAPartOfItselfByCopy)
{
    Value value = Array{Array{1, L"a text of some length"}, 2};
    value = value.get_array()[0];
    EXPECT_EQ(value, Value(Array{1, L"a text of some length"}));
    value = Object{{L"a", Object{{L"b", L"text"}}}};
    value = value.get_object()[L"a"].get_object()[L"b"];
    EXPECT_EQ(value, Value(L"text"));
}

TEST(JsonValueCopy, TakesAPartOfItselfByMove)
{
    Value value = Array{Array{1, L"a text of some length"}, 2};
    value = std::move(value.get_array()[0]);
    EXPECT_EQ(value, Value(Array{1, L"a text of some length"}));
    value = Object{{L"a", Object{{L"b", L"text"}}}};
    value = std::move(value.get_object()[L"a"].get_object()[L"b"]);
    EXPECT_EQ(value, Value(L"text"));
}

TEST(JsonValueCopy, CanBecomeAPartOfItself)
{
    Value value = Array{1};
    value.get_array().push_back(value);
    EXPECT_EQ(value, Value(Array{1, Array{1}}));
    value.get_array()[0] = value;
    EXPECT_EQ(value, Value(Array{Array{1, Array{1}}, Array{1}}));
}

TEST(JsonValueCopy, SwapsWithAnyOtherType)
{
    Value a = std::uint64_t{7};
    Value b = L"text";
    a.swap(b);
    EXPECT_EQ(a, Value(L"text"));
    EXPECT_FALSE(a.is_uint64());
    EXPECT_TRUE(b.is_uint64());
    EXPECT_EQ(b.get_uint64(), 7U);
}

} // namespace
