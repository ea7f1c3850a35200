/// Reading documents from untrusted sources: an error names the member that is refused.
#pragma once

#include "platform/sdk/OdString.h"
#include "json/json_value.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// The value of a text that is JSON. Throws `Failure`.
kutils::json::Value parsed(OdString const& text);

/// A value of a document and its place there. The value must outlive it, and so must the part that it was reached
/// through. All operations throw `Failure` when the value does not have the requested type.
class Part {
public:
    /// A whole document.
    explicit Part(kutils::json::Value const& value) : value_(&value) {}

    /// A member of an object.
    Part member(wchar_t const* key) const&;
    Part member(wchar_t const* key) const&& = delete;
    std::optional<Part> optionalMember(wchar_t const* key) const&;
    std::optional<Part> optionalMember(wchar_t const* key) const&& = delete;

    /// The number of elements of an array, and each of them.
    std::size_t size() const;
    Part operator[](std::size_t index) const&;
    Part operator[](std::size_t index) const&& = delete;

    /// A text, its surrogate pairs joined.
    OdString text() const;
    /// A text that survives conversion to bytes and back, and contains no NUL.
    OdString soundText() const;
    std::int64_t integer() const;
    bool truth() const;

    /// Throws `Failure`: "'commits[0].hash' <why>." with a next step that says that nothing has changed.
    [[noreturn]] void refuse(std::string const& why) const;

private:
    Part(kutils::json::Value const& value, Part const& owner, wchar_t const* key, std::size_t index)
        : value_(&value)
        , owner_(&owner)
        , key_(key)
        , index_(index)
    {
    }

    void require(kutils::json::Value_type type) const;
    std::string place() const;

    kutils::json::Value const* value_;
    Part const* owner_ = nullptr;
    wchar_t const* key_ = nullptr; ///< null for an element of an array
    std::size_t index_ = 0;
};

/// The next step of every refusal.
inline constexpr char const* kNothingChanged = "Nothing has changed on the server.";

} // namespace tav
