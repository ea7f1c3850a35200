/// The journal as earlier versions of tav kept it: a document in the settings of the database.
#pragma once

#include "host/repository/operation.h"

#include <string>

namespace tav {

/// What the document `text` of the database file `database` says. Throws `Failure` when it cannot be read.
PendingOperation readEarlierJournal(OdString const& text, std::string const& database);

} // namespace tav
