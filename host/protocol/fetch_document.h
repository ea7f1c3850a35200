/// What the server sends.
#pragma once

#include "host/protocol/history_document.h"

#include "json/json_value.h"

namespace tav {

/// A references document.
kutils::json::Value referencesDocument(std::vector<common::Reference> const& references);

/// A repository-data document.
kutils::json::Value repositoryDocument(OdString const& id, OdString const& name);

/// A commit of a fetch document, with all of its files.
OdString wholeCommitText(ChangedCommit const& commit, Tree const& tree);

} // namespace tav
