/// The value that every document is read into and written from: null, a scalar, a string, an array or an object.
#pragma once

#include "json/json_export.h"

#include <cstdint>
#include <map>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace kutils::json {

/// What a value holds. The numbers appear in the texts of `ValueError`.
enum class Value_type : std::int32_t { object, array, string, boolean, integer, real, null };

/// Thrown when a value does not have the requested type. The text is "value type is 2 not 0" when an object was
/// requested from a string.
class KUTILS_JSON_EXPORT ValueError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// The containers of a value whose texts are of type `S`. Objects are ordered by plain comparison of the characters of
/// their keys, so a value does not keep the order in which members were read or added.
template <class S>
struct KUTILS_JSON_EXPORT Config_map {
    using String = S; ///< texts and keys
    /// An object of values.
    template <class Value>
    using Object = std::map<String, Value>;
    /// An array of values.
    template <class Value>
    using Array = std::vector<Value>;
};

/// A JSON value. A plain value: copies are deep and independent, and any thread may use its own.
///
/// Values may be nested as deep as memory allows: copying, comparing, assigning and destroying never recurse, neither
/// for a value nor for a bare `Object` or `Array` of values. Destroying and moving allocate nothing and never throw;
/// the other operations throw what allocation throws, and then leave nothing behind.
template <class Config>
class KUTILS_JSON_EXPORT Value_impl {
public:
    using String = typename Config::String;                      ///< texts and keys
    using Object = typename Config::template Object<Value_impl>; ///< members by their keys
    using Array = typename Config::template Array<Value_impl>;   ///< elements in order

    /// A null value.
    Value_impl() noexcept = default;
    Value_impl(Value_impl const& other);
    /// Takes the content of `other` and leaves it null.
    Value_impl(Value_impl&& other) noexcept
        : type_(std::exchange(other.type_, Value_type::null))
        , is_uint64_(std::exchange(other.is_uint64_, false))
        , payload_(other.payload_)
    {
    }
    /// Takes over what it is given.
    Value_impl(Object object);
    /// Compilers do not agree whether `Array{Array{1}}` is an array in an array or a copy; `Array{Value(Array{1})}` is
    /// the former.
    Value_impl(Array array);
    /// Takes over what it is given.
    Value_impl(String string);
    /// Copies `string` up to its NUL; null gives the empty string.
    Value_impl(typename String::value_type const* string);
    /// Only a bool converts to a bool; a pointer does not.
    template <class T>
    Value_impl(T const*) = delete;
    Value_impl(bool value) noexcept : type_(Value_type::boolean) { payload_.boolean = value; }
    /// A signed integer.
    Value_impl(int value) noexcept : Value_impl(std::int64_t{value}) {}
    /// A signed integer.
    Value_impl(std::int64_t value) noexcept : type_(Value_type::integer)
    {
        payload_.integer = static_cast<std::uint64_t>(value);
    }
    /// An unsigned integer.
    Value_impl(std::uint64_t value) noexcept : type_(Value_type::integer), is_uint64_(true)
    {
        payload_.integer = value;
    }
    /// A real.
    Value_impl(double value) noexcept : type_(Value_type::real) { payload_.real = value; }

    /// `other` may be a part of this value, as in `value = value.get_array()[0]`.
    Value_impl& operator=(Value_impl const& other)
    {
        Value_impl copy(other);
        swap(copy);
        return *this;
    }
    /// As above; `other` is null afterwards, unless it is this value itself.
    Value_impl& operator=(Value_impl&& other) noexcept
    {
        Value_impl taken(std::move(other));
        swap(taken);
        return *this;
    }
    ~Value_impl()
    {
        if (type_ <= Value_type::string) {
            destroy();
        }
    }

    /// Exchanges the contents of both.
    void swap(Value_impl& other) noexcept
    {
        std::swap(type_, other.type_);
        std::swap(is_uint64_, other.is_uint64_);
        std::swap(payload_, other.payload_);
    }

    /// The type of the value.
    Value_type type() const noexcept { return type_; }
    /// Whether an integer was made or read as an unsigned one; false for every other type. The reader treats each
    /// integer without a minus sign as unsigned.
    bool is_uint64() const noexcept { return is_uint64_; }

    /// Throws `ValueError` unless the value is of type `expected`. Each of the accessors below checks its type first;
    /// the references they return live as long as the value is neither assigned to nor moved from.
    void check_type(Value_type expected) const
    {
        if (type_ != expected) {
            throw_type_error(expected);
        }
    }

    /// The content of the value, by reference where it is large.
    ///@{
    Object const& get_object() const { return check_type(Value_type::object), payload_.object->content; }
    Object& get_object() { return check_type(Value_type::object), payload_.object->content; }
    Array const& get_array() const { return check_type(Value_type::array), payload_.array->content; }
    Array& get_array() { return check_type(Value_type::array), payload_.array->content; }
    String const& get_string() const { return check_type(Value_type::string), *payload_.string; }
    String& get_string() { return check_type(Value_type::string), *payload_.string; }
    bool get_bool() const { return check_type(Value_type::boolean), payload_.boolean; }
    ///@}
    /// The low 32 bits of an integer, whatever the others are.
    std::int32_t get_int() const { return static_cast<std::int32_t>(get_uint64()); }
    /// The 64 bits of an integer, whether it is a signed or an unsigned one.
    std::int64_t get_int64() const { return static_cast<std::int64_t>(get_uint64()); }
    /// The same 64 bits as an unsigned integer.
    std::uint64_t get_uint64() const { return check_type(Value_type::integer), payload_.integer; }
    /// A real, or an integer converted to one.
    double get_real() const;

    /// Whether both have the same type and content. Integers are compared as numbers: a signed and an unsigned 5 are
    /// equal, since both are written `5`; -1 and 18446744073709551615 are not. An integer never equals a real. Reals
    /// are compared as doubles, so NaN equals nothing.
    friend bool operator==(Value_impl const& a, Value_impl const& b) { return a.equals(b); }
    /// The opposite.
    friend bool operator!=(Value_impl const& a, Value_impl const& b) { return !a.equals(b); }

private:
    /// A container on the heap. The link serves only to destroy a document without allocating memory.
    template <class Container>
    struct Box {
        Container content;
        Box* next = nullptr;
    };
    union Payload {
        Box<Object>* object;
        Box<Array>* array;
        String* string;
        bool boolean;
        std::uint64_t integer;
        double real;
    };
    struct CopyTask {
        Value_impl const* from;
        Value_impl* to;
    };
    struct ComparisonTask {
        Value_impl const* a;
        Value_impl const* b;
    };
    class Wreckage;

    [[noreturn]] void throw_type_error(Value_type expected) const;
    void destroy() noexcept;
    static void copy_content(CopyTask task, std::vector<CopyTask>& pending);
    static void copy_elements(CopyTask task, std::vector<CopyTask>& pending);
    bool equals(Value_impl const& other) const;
    static bool same_content(ComparisonTask task, std::vector<ComparisonTask>& pending);
    static bool same_elements(ComparisonTask task, std::vector<ComparisonTask>& pending);

    Value_type type_ = Value_type::null;
    bool is_uint64_ = false;
    Payload payload_{};
};

extern template class Value_impl<Config_map<std::wstring>>;

using Value = Value_impl<Config_map<std::wstring>>; ///< the one instance
using Object = Value::Object;                       ///< of the one instance
using Array = Value::Array;                         ///< of the one instance

} // namespace kutils::json
