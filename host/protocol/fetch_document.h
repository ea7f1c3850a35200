/// What the server sends.
#pragma once

#include "host/history/commit_tables.h"

#include "json/json_value.h"

namespace tav {

/// A references document.
kutils::json::Value referencesDocument(std::vector<common::Reference> const& references);

/// A repository-data document.
kutils::json::Value repositoryDocument(OdString const& id, OdString const& name);

/// The text of a fetch document with all commits behind the number `known`, each with all its files. It is written
/// commit by commit: as values it would take many times the room.
OdString fetchDocument(kutils::json::Value const& repository, CommitTables const& tables, std::int64_t known);

} // namespace tav
