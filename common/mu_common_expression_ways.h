/// How many ways there are to match an expression, for a matcher that backtracks. Internal to the library.
#pragma once

#include "common/mu_common_expression.h"

#include <cstddef>

namespace common {

/// How many steps it takes to check the state of `expression`, which has no parts, once. `\b` and `\B` are expensive:
/// each check looks up by name which characters belong to words.
double stepsOfALook(Expression const& expression);

/// How many steps a look-ahead takes before it matches anything: it clears its own memory for each of the `states` of
/// the automaton.
double stepsToLookAhead(double states);

/// How many steps it takes at most to match a text of `longestText` characters with backtracking, trying one way after
/// another, with an automaton of `states` states; infinity when that number may grow exponentially. Throws
/// `std::regex_error` when there are too many classes to compare. The expression must have been compiled before.
///
/// A choice that the next character decides adds no way: `[a-z]+[0-9]` can leave its loop only at the first digit. A
/// choice that it does not decide, as in `.*a`, adds as many ways as the text has characters. Inside a repetition it
/// adds that number for each iteration, so that their total is exponential.
double stepsWayByWay(Expression const& expression, std::size_t longestText, double states);

} // namespace common
