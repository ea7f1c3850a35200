#include "tests/json/documents.h"
#include "tests/support/rows.h"

#include <cmath>
#include <cstdint>
#include <gmock/gmock.h>
#include <limits>
#include <stdexcept>
#include <type_traits>
#include <vector>

namespace {

using namespace documents;
using kutils::json::ValueError;

static_assert(sizeof(Value) == 16);
static_assert(std::is_nothrow_move_constructible_v<Value>);
static_assert(std::is_nothrow_move_assignable_v<Value>);
static_assert(std::is_nothrow_destructible_v<Value>);
static_assert(std::is_base_of_v<std::runtime_error, ValueError>);
static_assert(std::is_same_v<Value, kutils::json::Value_impl<kutils::json::Config_map<std::wstring>>>);
static_assert(std::is_same_v<Object, std::map<std::wstring, Value>>);
static_assert(std::is_same_v<Array, std::vector<Value>>);
static_assert(!std::is_constructible_v<Value, void*>, "a pointer is no bool");
static_assert(!std::is_constructible_v<Value, char const*>, "a pointer is no bool");
static_assert(std::is_same_v<std::underlying_type_t<Value_type>, std::int32_t>);

constexpr auto kMaxSigned = std::numeric_limits<std::int64_t>::max();
constexpr auto kMinSigned = std::numeric_limits<std::int64_t>::min();
constexpr auto kMaxUnsigned = std::numeric_limits<std::uint64_t>::max();

TEST(JsonValue, TypesHaveTheNumbersThatMessagesShow)
{
    EXPECT_EQ(static_cast<int>(Value_type::object), 0);
    EXPECT_EQ(static_cast<int>(Value_type::array), 1);
    EXPECT_EQ(static_cast<int>(Value_type::string), 2);
    EXPECT_EQ(static_cast<int>(Value_type::boolean), 3);
    EXPECT_EQ(static_cast<int>(Value_type::integer), 4);
    EXPECT_EQ(static_cast<int>(Value_type::real), 5);
    EXPECT_EQ(static_cast<int>(Value_type::null), 6);
}

struct TypeRow {
    char const* name;
    Value value;
    Value_type type;
    bool is_uint64;
};

class JsonValueOf : public testing::TestWithParam<TypeRow> {};

INSTANTIATE_TEST_SUITE_P(
    Types, JsonValueOf,
    testing::Values(
        TypeRow{"Nothing", Value(), Value_type::null, false}, TypeRow{"Object", Object(), Value_type::object, false},
        TypeRow{"Array", Array(), Value_type::array, false},
        TypeRow{"String", std::wstring(L"plan"), Value_type::string, false},
        TypeRow{"Characters", L"plan", Value_type::string, false}, TypeRow{"Bool", false, Value_type::boolean, false},
        TypeRow{"Int", 7, Value_type::integer, false}, TypeRow{"Int64", std::int64_t{7}, Value_type::integer, false},
        TypeRow{"Uint64", std::uint64_t{7}, Value_type::integer, true}, TypeRow{"Double", 7.0, Value_type::real, false},
        TypeRow{"Float", 7.0F, Value_type::real, false}),
    support::rowName);

TEST_P(JsonValueOf, HasItsType)
{
    EXPECT_EQ(GetParam().value.type(), GetParam().type);
    EXPECT_EQ(GetParam().value.is_uint64(), GetParam().is_uint64);
}

TEST_P(JsonValueOf, IsRefusedAsAnyOtherType)
{
    int const held = static_cast<int>(GetParam().type);
    for (int wanted = 0; wanted < 7; ++wanted) {
        std::string message = "none";
        try {
            GetParam().value.check_type(static_cast<Value_type>(wanted));
        } catch (ValueError const& error) {
            message = error.what();
        }
        std::string const expected = "value type is " + std::to_string(held) + " not " + std::to_string(wanted);
        EXPECT_EQ(message, wanted == held ? "none" : expected);
    }
}

TEST_P(JsonValueOf, IsCopiedWhole)
{
    Value const copy = GetParam().value;
    EXPECT_EQ(copy, GetParam().value);
    EXPECT_EQ(copy.is_uint64(), GetParam().is_uint64);
}

TEST_P(JsonValueOf, LeavesNullWhereItWasMovedFrom)
{
    Value source = GetParam().value;
    Value const target = std::move(source);
    EXPECT_EQ(target, GetParam().value);
    EXPECT_EQ(target.is_uint64(), GetParam().is_uint64);
    EXPECT_EQ(source.type(), Value_type::null);
    EXPECT_FALSE(source.is_uint64());
}

TEST_P(JsonValueOf, LeavesNullWhereItWasMoveAssignedFrom)
{
    Value source = GetParam().value;
    Value target = L"before";
    target = std::move(source);
    EXPECT_EQ(target, GetParam().value);
    EXPECT_EQ(source.type(), Value_type::null);
}

TEST_P(JsonValueOf, SurvivesAssignmentToItself)
{
    Value value = GetParam().value;
    Value& same = value;
    value = same;
    EXPECT_EQ(value, GetParam().value);
    value = std::move(same);
    EXPECT_EQ(value, GetParam().value);
}

/// What an accessor says when it is called on a value of the wrong type.
template <class Access>
std::string refusal(Value value, Access access)
{
    try {
        access(value);
    } catch (ValueError const& error) {
        return error.what();
    }
    return "none";
}

TEST(JsonValue, AccessorsCheckTheTypeFirst)
{
    Value const text = L"text";
    Value const number = 1;
    EXPECT_EQ(refusal(text, [](Value& v) { v.get_object(); }), "value type is 2 not 0");
    EXPECT_EQ(refusal(text, [](Value const& v) { v.get_object(); }), "value type is 2 not 0");
    EXPECT_EQ(refusal(text, [](Value& v) { v.get_array(); }), "value type is 2 not 1");
    EXPECT_EQ(refusal(text, [](Value const& v) { v.get_array(); }), "value type is 2 not 1");
    EXPECT_EQ(refusal(number, [](Value& v) { v.get_string(); }), "value type is 4 not 2");
    EXPECT_EQ(refusal(number, [](Value const& v) { v.get_string(); }), "value type is 4 not 2");
    EXPECT_EQ(refusal(number, [](Value const& v) { v.get_bool(); }), "value type is 4 not 3");
    EXPECT_EQ(refusal(text, [](Value const& v) { v.get_int(); }), "value type is 2 not 4");
    EXPECT_EQ(refusal(text, [](Value const& v) { v.get_int64(); }), "value type is 2 not 4");
    EXPECT_EQ(refusal(1.0, [](Value const& v) { v.get_uint64(); }), "value type is 5 not 4");
    EXPECT_EQ(refusal(Value(), [](Value const& v) { v.get_real(); }), "value type is 6 not 5");
}

TEST(JsonValue, GivesWhatItWasMadeFrom)
{
    EXPECT_EQ(Value(Object{{L"a", 1}}).get_object().at(L"a").get_int(), 1);
    EXPECT_EQ(Value(Array{1, L"two"}).get_array().at(1).get_string(), L"two");
    EXPECT_EQ(Value(std::wstring(L"a\0b", 3)).get_string(), std::wstring(L"a\0b", 3));
    EXPECT_EQ(Value(L"plan.dwg").get_string(), L"plan.dwg");
    EXPECT_TRUE(Value(true).get_bool());
    EXPECT_FALSE(Value(false).get_bool());
    EXPECT_EQ(Value(-7).get_int64(), -7);
    EXPECT_EQ(Value(kMinSigned).get_int64(), kMinSigned);
    EXPECT_EQ(Value(kMaxUnsigned).get_uint64(), kMaxUnsigned);
    EXPECT_EQ(Value(0.1).get_real(), 0.1);
}

TEST(JsonValue, TakesANullPointerForTheEmptyString)
{
    wchar_t const* const nothing = nullptr;
    EXPECT_EQ(Value(nothing).get_string(), L"");
}

TEST(JsonValue, TakesChangeableCharactersForAString)
{
    wchar_t text[] = L"plan";
    EXPECT_EQ(Value(text).get_string(), L"plan");
}

TEST(JsonValue, GivesTheLow32BitsAsInt)
{
    EXPECT_EQ(Value(std::int64_t{4294967297}).get_int(), 1);
    EXPECT_EQ(Value(std::int64_t{2147483648}).get_int(), std::numeric_limits<std::int32_t>::min());
    EXPECT_EQ(Value(-1).get_int(), -1);
    EXPECT_EQ(Value(kMaxUnsigned).get_int(), -1);
}

TEST(JsonValue, GivesTheSameBitsSignedAndUnsigned)
{
    EXPECT_EQ(Value(-1).get_uint64(), kMaxUnsigned);
    EXPECT_EQ(Value(kMaxUnsigned).get_int64(), -1);
}

TEST(JsonValue, ConvertsAnIntegerToRealByItsSignedness)
{
    EXPECT_EQ(Value(-1).get_real(), -1.0);
    EXPECT_EQ(Value(kMaxUnsigned).get_real(), 18446744073709551615.0);
    EXPECT_EQ(Value(2).get_real(), 2.0);
}

TEST(JsonValue, ContainersAndStringsCanBeChangedInPlace)
{
    Value value = Object{{L"list", Array()}, {L"text", L"plan"}};
    value.get_object()[L"more"] = true;
    value.get_object()[L"list"].get_array().emplace_back(1);
    value.get_object()[L"text"].get_string() += L".dwg";
    EXPECT_EQ(value, Value(Object{{L"list", Array{1}}, {L"more", true}, {L"text", L"plan.dwg"}}));
}

TEST(JsonValue, OrdersMembersByPlainComparisonOfCharacters)
{
    std::vector<std::wstring> keys;
    Value const value = Object{{L"a", 1}, {L"B", 1}, {L"\x00E4", 1}, {L"", 1}, {L"aa", 1}, {L"\x1F600", 1}};
    for (auto const& member : value.get_object()) {
        keys.push_back(member.first);
    }
    EXPECT_THAT(keys, testing::ElementsAre(L"", L"B", L"a", L"aa", L"\x00E4", L"\x1F600"));
}

struct EqualityRow {
    char const* name;
    Value a;
    Value b;
    bool equal;
};

class JsonValueEquality : public testing::TestWithParam<EqualityRow> {};

INSTANTIATE_TEST_SUITE_P(
    Pairs, JsonValueEquality,
    testing::Values(
        EqualityRow{"Nulls", Value(), Value(), true}, EqualityRow{"Bools", true, true, true},
        EqualityRow{"OtherBools", true, false, false}, EqualityRow{"Strings", L"a", L"a", true},
        EqualityRow{"StringsOfOtherCase", L"a", L"A", false}, EqualityRow{"Integers", -5, -5, true},
        EqualityRow{"OtherIntegers", 5, 6, false},
        EqualityRow{"SignedAndUnsignedOfOneNumber", 5, std::uint64_t{5}, true},
        EqualityRow{"LargestSignedAsUnsigned", kMaxSigned, std::uint64_t{kMaxSigned}, true},
        EqualityRow{"SameBitsOfOtherNumbers", -1, kMaxUnsigned, false},
        EqualityRow{"SameBitsOfOtherLargeNumbers", kMinSigned, std::uint64_t{1} << 63, false},
        EqualityRow{"Reals", 0.5, 0.5, true}, EqualityRow{"ZeroesOfEitherSign", 0.0, -0.0, true},
        EqualityRow{"NeighbouringReals", 1.0, std::nextafter(1.0, 2.0), false}, EqualityRow{"Nan", NAN, NAN, false},
        EqualityRow{"IntegerAndReal", 1, 1.0, false}, EqualityRow{"NullAndFalse", Value(), false, false},
        EqualityRow{"BoolAndInteger", true, 1, false}, EqualityRow{"EmptyObjectAndArray", Object(), Array(), false},
        EqualityRow{"EmptyArrays", Array(), Array(), true}, EqualityRow{"Arrays", Array{1, 2}, Array{1, 2}, true},
        EqualityRow{"ArraysInOtherOrder", Array{1, 2}, Array{2, 1}, false},
        EqualityRow{"ArrayThatGoesOn", Array{1, 2}, Array{1}, false},
        EqualityRow{"Objects", Object{{L"a", 1}, {L"b", 2}}, Object{{L"b", 2}, {L"a", 1}}, true},
        EqualityRow{"ObjectsWithOtherKeys", Object{{L"a", 1}}, Object{{L"b", 1}}, false},
        EqualityRow{"ObjectsWithOtherValues", Object{{L"a", 1}}, Object{{L"a", 2}}, false},
        EqualityRow{"ObjectThatGoesOn", Object{{L"a", 1}, {L"b", 1}}, Object{{L"a", 1}}, false},
        EqualityRow{"NestedDifference", Array{Object{{L"a", Array{1}}}}, Array{Object{{L"a", Array{2}}}}, false},
        EqualityRow{"DifferenceBehindAnotherContainer", Array{Array{}, 1}, Array{Array{}, 2}, false}),
    support::rowName);

TEST_P(JsonValueEquality, HoldsBothWays)
{
    auto const& [name, a, b, equal] = GetParam();
    EXPECT_EQ(a == b, equal);
    EXPECT_EQ(b == a, equal);
    EXPECT_EQ(a != b, !equal);
}

} // namespace
