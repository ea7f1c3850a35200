// Any document: read, copied, compared, written and read back, in either layout and either locale.
#include "platform/sdk/OdString.h"
#include "json/json_parser.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <algorithm>
#include <clocale>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

namespace {

using kutils::json::read_string;
using kutils::json::Value;
using kutils::json::Value_type;
using kutils::json::write_string;

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

bool reads(std::wstring const& text, Value& out)
{
    return read_string(out, OdString(text.data(), text.size()));
}

// Infinity comes in as 1e999 and goes out as a word that is no JSON.
bool hasInfinity(Value const& root)
{
    std::vector<Value const*> pending = {&root};
    while (!pending.empty()) {
        Value const& value = *pending.back();
        pending.pop_back();
        if (value.type() == Value_type::real && std::isinf(value.get_real())) {
            return true;
        }
        if (value.type() == Value_type::array) {
            for (Value const& element : value.get_array()) {
                pending.push_back(&element);
            }
        } else if (value.type() == Value_type::object) {
            for (auto const& member : value.get_object()) {
                pending.push_back(&member.second);
            }
        }
    }
    return false;
}

void tryWriting(Value const& value, bool pretty, bool isExact)
{
    std::wstring const first = write_string(value, pretty);
    Value second;
    require(reads(first, second));
    require(!isExact || write_string(second, pretty) == first);

    Value third;
    require(reads(write_string(second, !pretty), third));
    require(third == second);
}

/// Puts every array of the document's object together again from what it gets.
class Collector final : public kutils::json::detail::Element_sink {
public:
    kutils::json::Object arrays;

    bool begin(std::wstring const& key) override
    {
        array_ = &arrays[key];
        *array_ = kutils::json::Array();
        return true;
    }
    bool take(Tokens& tokens) override
    {
        if (tokens.nextToken().kind != kutils::json::detail::Token_kind::close_object) {
            return false;
        }
        array_->get_array().emplace_back(kutils::json::Object());
        return true;
    }
    void take(Value element) override { array_->get_array().push_back(std::move(element)); }

private:
    Value* array_ = nullptr;
};

// Reading element by element comes to the same as reading whole.
void tryElements(OdString const& text, bool isRead, Value const& whole)
{
    Collector collector;
    Value document;
    require(kutils::json::detail::read_string(document, text, collector) == isRead);
    if (!isRead || document.type() != Value_type::object) {
        require(!isRead || write_string(document, false) == write_string(whole, false));
        return;
    }
    for (auto& [key, member] : document.get_object()) {
        if (member.type() == Value_type::array) {
            require(member.get_array().empty());
            member = std::move(collector.arrays[key]);
        }
    }
    require(write_string(document, false) == write_string(whole, false));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    if (size == 0) {
        return 0;
    }
    bool const pretty = (data[0] & 1U) != 0;
    std::setlocale(LC_CTYPE, (data[0] & 2U) != 0 ? "C.UTF-8" : "C");
    OdString const text(reinterpret_cast<char const*>(data) + 1, size - 1, CP_UTF_8);

    Value value = L"before";
    bool const isRead = read_string(value, text);
    tryElements(text, isRead, value);
    if (!isRead) {
        require(value == Value(L"before"));
        return 0;
    }
    Value const copy = value;
    require(copy == value);
    // An escape has room for 16 bits of a character: beyond them keys may change their order and meet.
    auto const isShort = [](wchar_t c) { return c >= 0 && c <= 0xFFFF; };
    bool const isExact = std::all_of(text.c_str(), text.c_str() + text.getLength(), isShort);
    if (!hasInfinity(value)) {
        tryWriting(value, pretty, isExact);
    }
    return 0;
}
