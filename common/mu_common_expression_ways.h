/// How many ways there are to match an expression. Internal to the library.
#pragma once

#include "common/mu_common_expression.h"

#include <cstddef>

namespace common {

/// How many steps one look at the state of `expression`, which has no parts, takes. Words are expensive: which
/// characters they have is looked up by name for each look.
double stepsOfALook(Expression const& expression);

/// How many steps a look-ahead takes before it looks at anything: it clears memory of its own for each of the `states`
/// of the automaton.
double stepsToLookAhead(double states);

/// How many steps it takes at most to match a text of `longestText` characters one way after the other, with an
/// automaton of `states` states; infinity when that number may grow exponentially. Throws `std::regex_error` when there
/// are too many classes to compare. The expression has been compiled before.
///
/// A choice that the next character decides makes no further way: `[a-z]+[0-9]` can leave its loop only where the first
/// digit comes. One that it does not decide, as in `.*a`, makes as many ways as the text has characters, and inside a
/// repetition that number for each round, so that all of them together are exponentially many.
double stepsWayByWay(Expression const& expression, std::size_t longestText, double states);

} // namespace common
