/// Tables of cases.
#pragma once

#include <string>

namespace support {

/// Names a row of a table by its member `name`: the last argument of `INSTANTIATE_TEST_SUITE_P`.
inline constexpr auto rowName = [](auto const& row) { return std::string(row.param.name); };

} // namespace support
