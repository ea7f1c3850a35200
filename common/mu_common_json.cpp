#include "common/mu_common_json.h"

#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

void mu_common_detail::throwNoValue()
{
    throw OdError(OdString("Attempting to get the value of an Expected type that contains an error.", CP_UTF_8));
}

namespace common {

namespace {

OdString filledIn(wchar_t const* format, OdString const& text)
{
    return OdString().format(format, text.c_str());
}

OdString composeErrorMessage(OdString const& message, OdString const& context, OdString const& key)
{
    OdString composed = message;
    if (!context.isEmpty()) {
        composed += filledIn(L"\nContext:\t%ls", context);
    }
    if (!key.isEmpty()) {
        composed += filledIn(L"\njson key:\t\"%ls\"", key);
    }
    return composed;
}

// Looking at each member of a small object is faster than making a key of the map's own type, which needs an
// allocation.
Object::const_iterator findMember(Object const& object, OdString const& key)
{
    constexpr std::size_t kSmall = 8;
    std::wstring_view const name(key.c_str(), key.getLength());
    if (object.size() > kSmall) {
        return object.find(std::wstring(name));
    }
    return std::find_if(object.begin(), object.end(), [&](auto const& member) { return member.first == name; });
}

Value const& getTyped(Object const& object, OdString const& key, OdString const& context, Value_type type)
{
    Value const& value = getValue(object, key, context);
    checkType(value, type, context, key);
    return value;
}

OdString toOdString(std::wstring const& text)
{
    return OdString(text.c_str(), text.size());
}

} // namespace

JsonParseError::JsonParseError(OdString const& message) : OdError(message) {}

OdString toString(Value_type type)
{
    switch (type) {
    case Value_type::object: return L"object";
    case Value_type::array: return L"array";
    case Value_type::string: return L"string";
    case Value_type::boolean: return L"bool";
    case Value_type::integer: return L"int";
    case Value_type::real: return L"real";
    case Value_type::null: return L"null";
    }
    return L"unknown_type";
}

bool hasKey(Object const& object, OdString const& key)
{
    return findMember(object, key) != object.end();
}

void checkType(Value const& value, Value_type expected, OdString const& context, OdString const& key)
{
    if (value.type() == expected) {
        return;
    }
    OdString message;
    message.format(
        L"Error:\tExpected json type '%ls', found '%ls'", toString(expected).c_str(), toString(value.type()).c_str());
    throw JsonParseError(composeErrorMessage(message, context, key));
}

Value const& getValue(Object const& object, OdString const& key, OdString const& context)
{
    auto const member = findMember(object, key);
    if (member == object.end()) {
        throw JsonParseError(composeErrorMessage(filledIn(L"Unable to find json key '%ls'", key), context, key));
    }
    return member->second;
}

Object const& getObjectValue(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::object).get_object();
}

Array const& getArrayValue(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::array).get_array();
}

OdString getStringValue(Object const& object, OdString const& key, OdString const& context)
{
    return toOdString(getTyped(object, key, context, Value_type::string).get_string());
}

OdString getStringValue(Value const& value)
{
    checkType(value, Value_type::string, OdString::kEmpty, OdString::kEmpty);
    return toOdString(value.get_string());
}

int getIntValue(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::integer).get_int();
}

std::int64_t getInt64Value(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::integer).get_int64();
}

std::uint64_t getUInt64Value(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::integer).get_uint64();
}

bool getBoolValue(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::boolean).get_bool();
}

double getDoubleValue(Object const& object, OdString const& key, OdString const& context)
{
    return getTyped(object, key, context, Value_type::real).get_real();
}

ErrorMessage composeMessage(Value const& found, Value_type expected, OdString const& whileDoing)
{
    return ErrorMessage(
        OdString("Encounterd '%ls', found '%ls. While %ls'", CP_UTF_8), toString(expected).c_str(),
        toString(found.type()).c_str(), whileDoing.c_str());
}

} // namespace common
