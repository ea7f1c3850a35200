#include "common/mu_common_json.h"
#include "common/mu_common_json_keys.h"

#include "tests/support/rows.h"
#include "json/json_reader.h"

#include <functional>
#include <gmock/gmock.h>
#include <limits>
#include <map>
#include <string>
#include <vector>

namespace {

using common::JsonParseError;
using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

Value valueOf(wchar_t const* text)
{
    Value value;
    EXPECT_TRUE(kutils::json::read_string(value, text)) << OdString(text).ansi_str();
    return value;
}

Object objectOf(wchar_t const* text)
{
    return valueOf(text).get_object();
}

Array arrayOf(wchar_t const* text)
{
    return valueOf(text).get_array();
}

template <class Read>
std::string thrownBy(Read const& read)
{
    try {
        read();
    } catch (JsonParseError const& error) {
        return error.description().ansi_str();
    }
    return "nothing was thrown";
}

template <class T>
std::string errorOf(Expected<T> const& result)
{
    return result.hasValue() ? "no error" : result.error().message.ansi_str();
}

struct TypeName {
    Value_type type;
    char const* name;
    wchar_t const* sample;
};

constexpr TypeName kTypes[] = {
    {Value_type::object, "object", L"{}"},    {Value_type::array, "array", L"[]"},
    {Value_type::string, "string", L"\"a\""}, {Value_type::boolean, "bool", L"true"},
    {Value_type::integer, "int", L"2"},       {Value_type::real, "real", L"2.0"},
    {Value_type::null, "null", L"null"},
};

TEST(JsonTypeNames, AreThoseOfTheMessages)
{
    for (TypeName const& type : kTypes) {
        EXPECT_EQ(common::toString(type.type).ansi_str(), type.name);
    }
}

TEST(JsonTypeNames, AreUnknownBeyondTheTypes)
{
    for (int const number : {7, -1, std::numeric_limits<int>::max()}) {
        EXPECT_EQ(common::toString(static_cast<Value_type>(number)).ansi_str(), "unknown_type");
    }
}

struct Accessor {
    char const* name;
    Value_type required;
    void (*read)(Object const& object, OdString const& key, OdString const& context);
};

template <auto Get>
void readWith(Object const& object, OdString const& key, OdString const& context)
{
    static_cast<void>(Get(object, key, context));
}

constexpr OdString (*kGetMemberString)(Object const&, OdString const&, OdString const&) = common::getStringValue;

constexpr Accessor kAccessors[] = {
    {"Object", Value_type::object, readWith<common::getObjectValue>},
    {"Array", Value_type::array, readWith<common::getArrayValue>},
    {"String", Value_type::string, readWith<kGetMemberString>},
    {"Int", Value_type::integer, readWith<common::getIntValue>},
    {"Int64", Value_type::integer, readWith<common::getInt64Value>},
    {"UInt64", Value_type::integer, readWith<common::getUInt64Value>},
    {"Bool", Value_type::boolean, readWith<common::getBoolValue>},
    {"Double", Value_type::real, readWith<common::getDoubleValue>},
};

void PrintTo(Accessor const& row, std::ostream* out)
{
    *out << row.name;
}

std::string nameOf(Value_type type)
{
    for (TypeName const& row : kTypes) {
        if (row.type == type) {
            return row.name;
        }
    }
    return "none";
}

class JsonAccessor : public testing::TestWithParam<Accessor> {};

INSTANTIATE_TEST_SUITE_P(Types, JsonAccessor, testing::ValuesIn(kAccessors), [](auto const& row) {
    return row.param.name;
});

TEST_P(JsonAccessor, RefusesAMissingMemberInThreeLines)
{
    EXPECT_EQ(
        thrownBy([] { GetParam().read(objectOf(LR"({"Path":1,"pat":2})"), L"path", L"projects"); }),
        "Unable to find json key 'path'\nContext:\tprojects\njson key:\t\"path\"");
}

TEST_P(JsonAccessor, RefusesEveryOtherTypeInThreeLines)
{
    for (TypeName const& other : kTypes) {
        Object object;
        object[L"path"] = valueOf(other.sample);
        std::string const expected = other.type == GetParam().required
                                         ? "nothing was thrown"
                                         : "Error:\tExpected json type '" + nameOf(GetParam().required) + "', found '" +
                                               other.name + "'\nContext:\tprojects\njson key:\t\"path\"";
        EXPECT_EQ(thrownBy([&] { GetParam().read(object, L"path", L"projects"); }), expected);
    }
}

TEST_P(JsonAccessor, LeavesAnEmptyContextOutOfTheMessage)
{
    EXPECT_EQ(
        thrownBy([] { GetParam().read(Object(), L"path", L""); }),
        "Unable to find json key 'path'\njson key:\t\"path\"");
}

TEST_P(JsonAccessor, LeavesAnEmptyKeyOutOfTheMessage)
{
    EXPECT_EQ(
        thrownBy([] { GetParam().read(Object(), L"", L"projects"); }),
        "Unable to find json key ''\nContext:\tprojects");
    EXPECT_EQ(thrownBy([] { GetParam().read(Object(), L"", L""); }), "Unable to find json key ''");
}

TEST_P(JsonAccessor, TakesPercentSignsForText)
{
    EXPECT_EQ(
        thrownBy([] { GetParam().read(Object(), L"%ls%n", L"%s100%"); }),
        "Unable to find json key '%ls%n'\nContext:\t%s100%\njson key:\t\"%ls%n\"");
}

TEST(JsonAccess, GivesAMemberOfAnyType)
{
    for (TypeName const& type : kTypes) {
        Object object;
        object[L"a"] = valueOf(type.sample);
        EXPECT_EQ(&common::getValue(object, L"a", L"projects"), &object[L"a"]);
    }
}

TEST(JsonAccess, RefusesAMissingMemberOfAnyType)
{
    EXPECT_EQ(
        thrownBy([] { common::getValue(objectOf(L"{}"), L"name", L"repository data"); }),
        "Unable to find json key 'name'\nContext:\trepository data\njson key:\t\"name\"");
}

TEST(JsonAccess, FindsAKeyOutsideAscii)
{
    Object const object = objectOf(L"{\"Gr\u00F6\u00DFe\":\"\u56FE\"}");
    EXPECT_EQ(common::getStringValue(object, L"Gr\u00F6\u00DFe", L""), OdString(L"\u56FE"));
    EXPECT_EQ(
        thrownBy([&] { common::getValue(object, L"Gro\u0308\u00DFe", L"\xDCFF"); }),
        "Unable to find json key 'Gro\u0308\u00DFe'\nContext:\t\xFF\njson key:\t\"Gro\u0308\u00DFe\"");
}

TEST(JsonAccess, GivesTheContainersThemselves)
{
    Object const object = objectOf(LR"({"o":{"a":1},"a":[1,2]})");
    EXPECT_EQ(&common::getObjectValue(object, L"o", L""), &object.at(L"o").get_object());
    EXPECT_EQ(&common::getArrayValue(object, L"a", L""), &object.at(L"a").get_array());
}

TEST(JsonAccess, GivesStringsWhole)
{
    Object const object = objectOf(LR"({"empty":"","plain":"plan.dwg","nul":"a\u0000b"})");
    EXPECT_EQ(common::getStringValue(object, L"empty", L""), OdString());
    EXPECT_EQ(common::getStringValue(object, L"plain", L""), OdString(L"plan.dwg"));
    EXPECT_EQ(common::getStringValue(object, L"nul", L""), OdString(L"a\0b", 3));
}

TEST(JsonAccess, GivesBooleans)
{
    Object const object = objectOf(LR"({"yes":true,"no":false})");
    EXPECT_TRUE(common::getBoolValue(object, L"yes", L""));
    EXPECT_FALSE(common::getBoolValue(object, L"no", L""));
}

struct Integer {
    char const* name;
    wchar_t const* text;
    int asInt;
    std::int64_t asInt64;
    std::uint64_t asUInt64;
};

void PrintTo(Integer const& row, std::ostream* out)
{
    *out << row.name;
}

class JsonInteger : public testing::TestWithParam<Integer> {};

TEST_P(JsonInteger, IsReadInEachWidth)
{
    Object object;
    object[L"n"] = valueOf(GetParam().text);
    EXPECT_EQ(common::getIntValue(object, L"n", L""), GetParam().asInt);
    EXPECT_EQ(common::getInt64Value(object, L"n", L""), GetParam().asInt64);
    EXPECT_EQ(common::getUInt64Value(object, L"n", L""), GetParam().asUInt64);
}

constexpr std::int64_t kMin64 = std::numeric_limits<std::int64_t>::min();
constexpr std::uint64_t kMax64 = std::numeric_limits<std::uint64_t>::max();

INSTANTIATE_TEST_SUITE_P(
    Numbers, JsonInteger,
    testing::Values(
        Integer{"Zero", L"0", 0, 0, 0}, Integer{"One", L"1", 1, 1, 1}, Integer{"MinusOne", L"-1", -1, -1, kMax64},
        Integer{"LowBitsBeyond32", L"4294967297", 1, 4294967297, 4294967297},
        Integer{"Bit31TurnsNegative", L"2147483648", std::numeric_limits<int>::min(), 2147483648, 2147483648},
        Integer{"Smallest", L"-9223372036854775808", 0, kMin64, 9223372036854775808U},
        Integer{"Bit63TurnsNegative", L"9223372036854775808", 0, kMin64, 9223372036854775808U},
        Integer{"Largest", L"18446744073709551615", -1, -1, kMax64}),
    support::rowName);

TEST(JsonDouble, IsReadFromANumberWithFractionOrExponent)
{
    Object const object = objectOf(LR"({"fraction":2.0,"exponent":2e0,"negative":-0.5})");
    EXPECT_EQ(common::getDoubleValue(object, L"fraction", L""), 2.0);
    EXPECT_EQ(common::getDoubleValue(object, L"exponent", L""), 2.0);
    EXPECT_EQ(common::getDoubleValue(object, L"negative", L""), -0.5);
}

TEST(JsonDouble, IsNotReadFromAnInteger)
{
    EXPECT_EQ(
        thrownBy([] { common::getDoubleValue(objectOf(LR"({"scale":2})"), L"scale", L"projects"); }),
        "Error:\tExpected json type 'real', found 'int'\nContext:\tprojects\njson key:\t\"scale\"");
}

TEST(JsonStringOfAValue, IsItsText)
{
    EXPECT_EQ(common::getStringValue(valueOf(LR"("plan.dwg")")), OdString(L"plan.dwg"));
    EXPECT_EQ(common::getStringValue(Value(std::wstring(L"a\0b", 3))), OdString(L"a\0b", 3));
}

TEST(JsonStringOfAValue, IsRefusedWithoutContextAndKey)
{
    EXPECT_EQ(
        thrownBy([] { common::getStringValue(valueOf(L"5")); }), "Error:\tExpected json type 'string', found 'int'");
}

TEST(JsonTypeCheck, PassesTheTypeThatIsExpected)
{
    for (TypeName const& type : kTypes) {
        EXPECT_NO_THROW(common::checkType(valueOf(type.sample), type.type, L"projects", L"name"));
    }
}

TEST(JsonTypeCheck, NamesWhatItIsGiven)
{
    auto const messageFor = [](wchar_t const* context, wchar_t const* key) {
        return thrownBy([&] { common::checkType(Value(), Value_type::array, context, key); });
    };
    std::string const line = "Error:\tExpected json type 'array', found 'null'";
    EXPECT_EQ(messageFor(L"", L""), line);
    EXPECT_EQ(messageFor(L"projects", L""), line + "\nContext:\tprojects");
    EXPECT_EQ(messageFor(L"", L"path"), line + "\njson key:\t\"path\"");
    EXPECT_EQ(messageFor(L"%n", L"%ls"), line + "\nContext:\t%n\njson key:\t\"%ls\"");
}

TEST(JsonTypeCheck, NamesATypeBeyondTheTypes)
{
    EXPECT_EQ(
        thrownBy([] { common::checkType(Value(1), static_cast<Value_type>(7), L"", L""); }),
        "Error:\tExpected json type 'unknown_type', found 'int'");
}

TEST(JsonKey, IsFoundExactly)
{
    Object const object = objectOf(LR"({"path":null,"":1,"a\u0000b":2})");
    EXPECT_TRUE(common::hasKey(object, L"path"));
    EXPECT_TRUE(common::hasKey(object, L""));
    EXPECT_TRUE(common::hasKey(object, OdString(L"a\0b", 3)));
    for (wchar_t const* other : {L"Path", L"PATH", L"pat", L"path ", L"a"}) {
        EXPECT_FALSE(common::hasKey(object, other)) << OdString(other).ansi_str();
    }
}

TEST(JsonKey, IsFoundAmongAnyNumberOfMembers)
{
    Object object;
    for (int count = 0; count < 20; ++count) {
        SCOPED_TRACE(std::to_string(count) + " members");
        EXPECT_FALSE(common::hasKey(object, L"missing"));
        for (int i = 0; i < count; ++i) {
            OdString const key(std::to_wstring(i).c_str());
            EXPECT_TRUE(common::hasKey(object, key));
            EXPECT_EQ(common::getIntValue(object, key, L""), i);
        }
        object[std::to_wstring(count)] = count;
    }
}

TEST(JsonMismatch, KeepsItsSpelling)
{
    ErrorMessage const error = common::composeMessage(Value(5), Value_type::object, L"parsing %ls.");
    EXPECT_EQ(error.message.ansi_str(), "Encounterd 'object', found 'int. While parsing %ls.'");
    EXPECT_EQ(error.code, 0);
}

TEST(JsonMismatch, NamesEveryType)
{
    for (TypeName const& type : kTypes) {
        EXPECT_EQ(
            common::composeMessage(valueOf(type.sample), Value_type::string, L"testing").message.ansi_str(),
            std::string("Encounterd 'string', found '") + type.name + ". While testing'");
    }
}

/// Reads {"name":...}; {"refuse":...} gives an error with a code.
Expected<std::string> toName(Object const& object)
{
    if (common::hasKey(object, L"refuse")) {
        ErrorMessage error(L"refused %ls", common::getStringValue(object, L"refuse", L"").c_str());
        error.code = 7;
        return error;
    }
    return common::getStringValue(object, L"name", L"names").ansi_str();
}

Expected<std::vector<std::string>> namesIn(wchar_t const* text)
{
    return common::fromJsonVector<std::string>(arrayOf(text), &toName);
}

TEST(FromJsonVector, ConvertsInOrder)
{
    EXPECT_THAT(namesIn(LR"([{"name":"b"},{"name":"a"},{"name":"b"}])").value(), ElementsAre("b", "a", "b"));
}

TEST(FromJsonVector, OfAnEmptyArrayIsEmpty)
{
    EXPECT_THAT(namesIn(L"[]").value(), IsEmpty());
}

TEST(FromJsonVector, RefusesAnElementThatIsNoObject)
{
    EXPECT_EQ(errorOf(namesIn(LR"([{"name":"a"},5])")), "Encounterd 'object', found 'int. While parsing json vector.'");
    for (TypeName const& type : kTypes) {
        std::string const expected = type.type == Value_type::object ? "refused b"
                                                                     : std::string("Encounterd 'object', found '") +
                                                                           type.name + ". While parsing json vector.'";
        Array array = arrayOf(LR"([{"name":"a"},{"refuse":"b"}])");
        if (type.type != Value_type::object) {
            array[1] = valueOf(type.sample);
        }
        EXPECT_EQ(errorOf(common::fromJsonVector<std::string>(array, &toName)), expected);
    }
}

TEST(FromJsonVector, ReturnsTheFirstErrorWithItsCode)
{
    Expected<std::vector<std::string>> const result = namesIn(LR"([{"name":"a"},{"refuse":"b"},{"refuse":"c"},5])");
    EXPECT_EQ(errorOf(result), "refused b");
    EXPECT_EQ(result.error().code, 7);
}

TEST(FromJsonVector, LetsExceptionsPass)
{
    EXPECT_EQ(
        thrownBy([] { static_cast<void>(namesIn(LR"([{"other":1}])")); }),
        "Unable to find json key 'name'\nContext:\tnames\njson key:\t\"name\"");
}

TEST(FromJsonVector, ConvertsToWhatCanOnlyBeMoved)
{
    Expected<std::unique_ptr<int>> (*const convert)(Object const&) = [](Object const& object) {
        return Expected<std::unique_ptr<int>>(std::make_unique<int>(common::getIntValue(object, L"n", L"")));
    };
    auto const result = common::fromJsonVector<std::unique_ptr<int>>(arrayOf(LR"([{"n":3}])"), convert);
    EXPECT_EQ(*result.value().at(0), 3);
}

std::pair<OdString, int> toEntry(Object object)
{
    return {common::getStringValue(object, L"key", L"entries"), common::getIntValue(object, L"n", L"entries")};
}

TEST(FromJsonMap, KeepsTheFirstOfSeveralEntriesWithOneKey)
{
    Array const array = arrayOf(LR"([{"key":"b","n":1},{"key":"a","n":2},{"key":"b","n":3},{"key":"a","n":4}])");
    EXPECT_THAT(
        (common::fromJsonMap<OdString, int>(array, &toEntry).value()), ElementsAre(Pair(L"a", 2), Pair(L"b", 1)));
}

TEST(FromJsonMap, OfAnEmptyArrayIsEmpty)
{
    EXPECT_THAT((common::fromJsonMap<OdString, int>({}, &toEntry).value()), IsEmpty());
}

TEST(FromJsonMap, LeavesTheArrayOfTheCallerAlone)
{
    Array const array = arrayOf(LR"([{"key":"a","n":1}])");
    static_cast<void>(common::fromJsonMap<OdString, int>(array, &toEntry));
    EXPECT_EQ(array, arrayOf(LR"([{"key":"a","n":1}])"));
}

TEST(FromJsonMap, RefusesAnElementThatIsNoObject)
{
    for (TypeName const& type : kTypes) {
        Array array = arrayOf(LR"([{"key":"a","n":1}])");
        array.push_back(valueOf(type.sample));
        if (type.type != Value_type::object) {
            EXPECT_EQ(
                errorOf(common::fromJsonMap<OdString, int>(array, &toEntry)),
                std::string("Encounterd 'object', found '") + type.name + ". While parsing json map.'");
        }
    }
}

TEST(FromJsonMap, LetsExceptionsPass)
{
    EXPECT_EQ(
        thrownBy([] { static_cast<void>(common::fromJsonMap<OdString, int>(arrayOf(L"[{}]"), &toEntry)); }),
        "Unable to find json key 'key'\nContext:\tentries\njson key:\t\"key\"");
}

Object toObject(OdString const& key, int const& n)
{
    Object object;
    object[L"key"] = Value(key.c_str());
    object[L"n"] = Value(n);
    return object;
}

TEST(ToJsonOfAMap, ConvertsInTheOrderOfTheKeys)
{
    std::map<OdString, int> const map = {{L"b", 1}, {L"a", 2}, {L"B", 3}};
    EXPECT_EQ(common::toJson(map, toObject), arrayOf(LR"([{"key":"B","n":3},{"key":"a","n":2},{"key":"b","n":1}])"));
}

TEST(ToJsonOfAMap, OfAnEmptyMapIsAnEmptyArray)
{
    EXPECT_THAT(common::toJson(std::map<OdString, int>(), toObject), IsEmpty());
}

TEST(ToJsonOfAMap, ThrowsForAnEmptyFunction)
{
    std::map<OdString, int> const map = {{L"a", 1}};
    EXPECT_THROW(common::toJson(map, {}), std::bad_function_call);
}

TEST(ToJsonOfAMap, ReadsBackAsItWas)
{
    std::map<OdString, int> const map = {{L"a", 1}, {L"b", -2}};
    EXPECT_EQ((common::fromJsonMap<OdString, int>(common::toJson(map, toObject), &toEntry).value()), map);
}

/// Odd numbers are refused, with a code.
Expected<Object> evenToObject(int const& n)
{
    if (n % 2 != 0) {
        ErrorMessage error(L"%ls is odd", std::to_wstring(n).c_str());
        error.code = n;
        return error;
    }
    return toObject(L"even", n);
}

TEST(ToJsonOfAVector, ConvertsInOrder)
{
    EXPECT_EQ(
        common::toJson(std::vector<int>{4, 2}, evenToObject).value(),
        arrayOf(LR"([{"key":"even","n":4},{"key":"even","n":2}])"));
}

TEST(ToJsonOfAVector, OfAnEmptyVectorIsAnEmptyArray)
{
    EXPECT_THAT(common::toJson(std::vector<int>(), evenToObject).value(), IsEmpty());
}

TEST(ToJsonOfAVector, ReturnsTheFirstErrorWithItsCode)
{
    Expected<Array> const result = common::toJson(std::vector<int>{2, 3, 5}, evenToObject);
    EXPECT_EQ(errorOf(result), "3 is odd");
    EXPECT_EQ(result.error().code, 3);
}

TEST(ToJsonOfAVector, ThrowsForAnEmptyFunction)
{
    EXPECT_THROW(static_cast<void>(common::toJson(std::vector<int>{2}, {})), std::bad_function_call);
}

TEST(JsonKeys, AreThoseOfTheDocuments)
{
    EXPECT_EQ(common::json::s_head, OdString(L"head"));
    EXPECT_EQ(common::json::s_reference, OdString(L"reference"));
    EXPECT_EQ(common::json::s_commit, OdString(L"commit"));
    EXPECT_EQ(common::json::s_staged_files, OdString(L"staged_files"));
    EXPECT_EQ(common::json::s_path, OdString(L"path"));
    EXPECT_EQ(common::json::s_renames, OdString(L"renames"));
}

} // namespace
