/// Reading and showing documents in tests of the JSON layer.
#pragma once

#include "platform/sdk/OdString.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <gtest/gtest.h>
#include <ostream>
#include <string>

namespace kutils::json {

/// Shows a value in messages as compact text. A value of any depth is fine, but a large one fills the screen.
inline void PrintTo(Value const& value, std::ostream* out)
{
    *out << OdString(write_string(value, false).c_str()).ansi_str();
}

} // namespace kutils::json

namespace documents {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

inline bool reads(std::wstring const& text, Value& out)
{
    return kutils::json::read_string(out, OdString(text.data(), text.size()));
}

inline bool reads(std::wstring const& text)
{
    Value value;
    return reads(text, value);
}

/// The value of a text that is expected to be a document; null, and a failure, if it is none.
inline Value read(std::wstring const& text)
{
    Value value;
    EXPECT_TRUE(reads(text, value)) << "not read: " << testing::PrintToString(text.substr(0, 80));
    return value;
}

/// `text`, `count` times.
inline std::wstring repeat(std::wstring const& text, std::size_t count)
{
    std::wstring all;
    all.reserve(text.size() * count);
    for (std::size_t i = 0; i < count; ++i) {
        all += text;
    }
    return all;
}

} // namespace documents
