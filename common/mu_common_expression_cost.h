/// What an expression may cost at worst, whatever the text. Internal to the library.
#pragma once

#include "common/mu_common_expression.h"

#include <cstddef>

namespace common {

/// Of a file.
constexpr std::size_t kLongestName = 255;
/// The longest text that back references are followed through: each character takes some levels of recursion.
constexpr std::size_t kLongestText = 1024;

// Each of these throws `std::regex_error` for an expression that is beyond the bounds, which are the same for all: in
// the levels of recursion that it may take, in the states of its automaton, and in steps. A step is one look at one
// state of the automaton for one character of the text.

/// Compiling: its recursion, its memory, and its time, which is quadratic in the number of alternatives and long for
/// classes.
void checkCompiling(Expression const& expression);

/// Matching a text of up to `longestText` characters in all ways at once, without back references: each state is looked
/// at once for each position where it may be reached. A look-ahead is a match of its own at each of its positions.
void checkMatchingAtOnce(Expression const& expression, std::size_t longestText);

/// The same one way after the other, as back references need it. The expression has been compiled.
void checkMatchingWayByWay(Expression const& expression, std::size_t longestText);

} // namespace common
