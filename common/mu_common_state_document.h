/// The document of a working state. Internal to the library.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_state.h"

#include "platform/sdk/OdString.h"

#include <string>

namespace common {

/// The state that the file `path` holds. Error: what the document lacks, or what of it has no meaning. Throws `OdError`
/// as `readDocument` does, and when a member is of another type than it should be.
Expected<State> readState(OdString const& path);

/// The document of `state`, in the pretty layout. Error: a staged change that has no text form.
Expected<std::wstring> textOf(State const& state);

} // namespace common
