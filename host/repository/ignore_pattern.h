/// From what users type to the rules that an ignore file holds.
#pragma once

#include "platform/sdk/OdString.h"

#include <string>

namespace tav {

/// The rule for `typed`. A wildcard, where '*' stands for any text and '?' for one character, becomes the expression
/// that matches the same names. Everything else is an expression already: what has other special characters of
/// expressions than '*', '?' and '.', or none at all, and what begins with '.*', which no name matches as a wildcard
/// that is not hidden anyway.
OdString ruleFor(std::string const& typed);

/// The rule that matches this one name, whatever characters it has.
OdString ruleForName(std::string const& name);

} // namespace tav
