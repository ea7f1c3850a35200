/// Typed access to JSON documents, for readers that tell the user what is wrong with a document.
///
/// Readers never touch JSON values directly: they look a member up, check its type and convert it with the functions
/// here, which throw `JsonParseError` when the document does not have the expected shape. In all of them `key` is the
/// member's name, matched exactly, and `context` says in words what was being read; an empty one leaves its line out of
/// the message. These messages are not translated. References that are returned live as long as the object they point
/// into stays as it is.
///
/// The conversions of whole containers return an element's error instead of throwing it.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"

#include "platform/sdk/OdError.h"
#include "platform/sdk/OdString.h"
#include "json/json_value.h"

#include <cstdint>
#include <functional>
#include <map>
#include <utility>
#include <vector>

namespace common {

/// A document does not have the expected shape.
class MU_COMMON_EXPORT JsonParseError : public OdError {
public:
    /// Carries `message`, in which nothing is translated.
    explicit JsonParseError(OdString const& message);
};

/// "object", "array", "string", "bool", "int", "real", "null", or "unknown_type" for any other number.
MU_COMMON_EXPORT OdString toString(kutils::json::Value_type type);

/// Whether `object` has a member `key`.
MU_COMMON_EXPORT bool hasKey(kutils::json::Object const& object, OdString const& key);

/// Throws unless `value` is of type `expected`.
MU_COMMON_EXPORT void checkType(
    kutils::json::Value const& value, kutils::json::Value_type expected, OdString const& context, OdString const& key);

/// The member of any type; throws when it is missing. So do all the accessors below, and also when it is of another
/// type than the one they name.
MU_COMMON_EXPORT kutils::json::Value const&
getValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The object of the member.
MU_COMMON_EXPORT kutils::json::Object const&
getObjectValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The array of the member.
MU_COMMON_EXPORT kutils::json::Array const&
getArrayValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The text of the member.
MU_COMMON_EXPORT OdString
getStringValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The text of a value that is a string.
MU_COMMON_EXPORT OdString getStringValue(kutils::json::Value const& value);
/// The low 32 bits of an integer, as a signed number; the range is not checked.
MU_COMMON_EXPORT int getIntValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The 64 bits of an integer, as a signed number.
MU_COMMON_EXPORT std::int64_t
getInt64Value(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The 64 bits of an integer, as an unsigned number: -1 gives 18446744073709551615.
MU_COMMON_EXPORT std::uint64_t
getUInt64Value(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// The truth value of the member.
MU_COMMON_EXPORT bool getBoolValue(kutils::json::Object const& object, OdString const& key, OdString const& context);
/// A number with fraction or exponent. One without (2) is an integer and is rejected: 2.0 and 2e0 are reals.
MU_COMMON_EXPORT double
getDoubleValue(kutils::json::Object const& object, OdString const& key, OdString const& context);

/// The error of a value that is of another type than expected; `whileDoing` says in words what was being done.
MU_COMMON_EXPORT ErrorMessage
composeMessage(kutils::json::Value const& found, kutils::json::Value_type expected, OdString const& whileDoing);

namespace cpp20 {

/// Names a type without taking part in the deduction of template arguments.
template <class T>
struct type_identity {
    using type = T; ///< the type itself
};

/// The type of `type_identity`.
template <class T>
using type_identity_t = typename type_identity<T>::type;

} // namespace cpp20

/// Converts the elements of `array` in order with `convert`, which takes an `Object const&` and returns an
/// `Expected<T>`. Returns the first error: of an element that is no object, or of `convert`. Exceptions of `convert`
/// pass. The array is only looked at: readers of large documents need no copy of it.
template <class T, class Convert>
Expected<std::vector<T>> convertElements(kutils::json::Array const& array, Convert const& convert)
{
    std::vector<T> result;
    result.reserve(array.size());
    for (kutils::json::Value const& element : array) {
        if (element.type() != kutils::json::Value_type::object) {
            return composeMessage(element, kutils::json::Value_type::object, L"parsing json vector.");
        }
        Expected<T> converted = convert(element.get_object());
        if (!converted.hasValue()) {
            return converted.error();
        }
        result.push_back(std::move(converted).visit(GetRValueOrThrow<T>{}));
    }
    return result;
}

/// The same for an array of the caller's own and a function.
template <class T>
Expected<std::vector<T>>
fromJsonVector(kutils::json::Array array, Expected<T> (*convert)(kutils::json::Object const& object))
{
    return convertElements<T>(array, convert);
}

/// Converts the elements of `array` into entries of a map; of several entries with one key the first is kept. Returns
/// the error of the first element that is no object. Exceptions of `convert` pass.
template <class K, class V>
Expected<std::map<K, V>> fromJsonMap(kutils::json::Array array, std::pair<K, V> (*convert)(kutils::json::Object object))
{
    std::map<K, V> result;
    for (kutils::json::Value& element : array) {
        if (element.type() != kutils::json::Value_type::object) {
            return composeMessage(element, kutils::json::Value_type::object, L"parsing json map.");
        }
        // The array is this function's own: its objects are handed over, not copied. Written maps are in ascending
        // order, for which the end is the right hint.
        std::pair<K, V> entry = convert(std::move(element.get_object()));
        result.emplace_hint(result.end(), std::move(entry.first), std::move(entry.second));
    }
    return result;
}

/// Converts the entries of `map` in key order; an empty `convert` throws `std::bad_function_call`.
template <class K, class V>
kutils::json::Array toJson(
    std::map<K, V> const& map,
    cpp20::type_identity_t<std::function<kutils::json::Object(K const&, V const&)>> const& convert)
{
    kutils::json::Array array;
    array.reserve(map.size());
    for (auto const& [key, value] : map) {
        array.emplace_back(convert(key, value));
    }
    return array;
}

/// Converts the elements of `vector` in order; the first error of `convert` is returned.
template <class T>
Expected<kutils::json::Array> toJson(
    std::vector<T> const& vector,
    cpp20::type_identity_t<std::function<Expected<kutils::json::Object>(T const&)>> const& convert)
{
    kutils::json::Array array;
    array.reserve(vector.size());
    for (T const& element : vector) {
        Expected<kutils::json::Object> converted = convert(element);
        if (!converted.hasValue()) {
            return converted.error();
        }
        array.emplace_back(std::move(converted).visit(GetRValueOrThrow<kutils::json::Object>{}));
    }
    return array;
}

} // namespace common
