/// Limits on the worst-case cost of an expression, whatever the text. Internal to the library.
#pragma once

#include "common/mu_common_expression.h"

#include <cstddef>

namespace common {

/// The longest name of a file, in bytes.
constexpr std::size_t kLongestName = 255;
/// The longest text for an expression with back references: each character takes some levels of recursion.
constexpr std::size_t kLongestText = 1024;

// Each of these throws `std::regex_error` for an expression that exceeds the limits, which are the same for all: levels
// of recursion, states of the automaton, and steps. A step checks one state of the automaton for one character of the
// text.

/// Checks compiling: its recursion, its memory, and its time, which is quadratic in the number of alternatives and long
/// for classes.
void checkCompiling(Expression const& expression);

/// Checks matching a text of up to `longestText` characters in all ways at once, without back references: each state is
/// checked once for each position where it can be reached. A look-ahead is a separate match at each of its positions.
void checkMatchingAtOnce(Expression const& expression, std::size_t longestText);

/// Checks matching one way after another, with backtracking, which back references require. The expression must have
/// been compiled.
void checkMatchingWayByWay(Expression const& expression, std::size_t longestText);

} // namespace common
