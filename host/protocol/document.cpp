#include "host/protocol/document.h"

#include "host/protocol/refusal.h"
#include "host/text/characters.h"

#include "common/mu_common_json.h"
#include "json/json_reader.h"

#include <algorithm>
#include <limits>

namespace tav {

namespace {

using kutils::json::Value;
using kutils::json::Value_type;

OdString textOf(std::wstring const& text)
{
    return OdString(text.data(), text.size());
}

} // namespace

Value parsed(OdString const& text)
{
    Value value;
    if (!kutils::json::read_string(value, text)) {
        throw refusal(ServerError::badDocument, "The document is not valid JSON.", kNothingChanged);
    }
    return value;
}

Part Part::member(wchar_t const* key) const&
{
    std::optional<Part> const found = optionalMember(key);
    if (!found) {
        refuse("lacks the member '" + OdString(key).ansi_str() + "'");
    }
    return *found;
}

std::optional<Part> Part::optionalMember(wchar_t const* key) const&
{
    require(Value_type::object);
    auto const& object = value_->get_object();
    auto const found = object.find(key);
    return found == object.end() ? std::nullopt : std::optional(Part(found->second, *this, key, 0));
}

std::size_t Part::size() const
{
    require(Value_type::array);
    return value_->get_array().size();
}

Part Part::operator[](std::size_t index) const&
{
    return Part(value_->get_array().at(index), *this, nullptr, index);
}

OdString Part::text() const
{
    require(Value_type::string);
    return withoutPairs(textOf(value_->get_string()));
}

OdString Part::soundText() const
{
    OdString const content = text();
    wchar_t const* const begin = content.c_str();
    bool const hasNul = std::find(begin, begin + content.getLength(), L'\0') != begin + content.getLength();
    if (hasNul || !isSound(content)) {
        refuse("contains a NUL or an unpaired surrogate");
    }
    return content;
}

std::int64_t Part::integer() const
{
    require(Value_type::integer);
    bool const isTooLarge = value_->is_uint64() && value_->get_int64() < 0;
    return isTooLarge ? std::numeric_limits<std::int64_t>::max() : value_->get_int64();
}

bool Part::truth() const
{
    require(Value_type::boolean);
    return value_->get_bool();
}

void Part::refuse(std::string const& why) const
{
    std::string const where = place();
    throw refusal(
        ServerError::badDocument, (where.empty() ? "The document" : "'" + where + "'") + " " + why + ".",
        kNothingChanged);
}

void Part::require(Value_type type) const
{
    if (value_->type() != type) {
        refuse(
            "must be of type " + common::toString(type).ansi_str() + ", not " +
            common::toString(value_->type()).ansi_str());
    }
}

std::string Part::place() const
{
    if (!owner_) {
        return {};
    }
    std::string const before = owner_->place();
    if (!key_) {
        return before + "[" + std::to_string(index_) + "]";
    }
    return (before.empty() ? before : before + ".") + OdString(key_).ansi_str();
}

} // namespace tav
