// Any document: read, copied, compared, written and read back, in either layout and either locale.
#include "platform/sdk/OdString.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <algorithm>
#include <clocale>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <string>
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
    if (!read_string(value, text)) {
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
