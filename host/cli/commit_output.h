/// Commits and what they changed, for people and for programs.
#pragma once

#include "host/changes/committed_changes.h"
#include "host/repository/local_database.h"

#include "json/json_value.h"

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// The members of a commit in documents: "author", "date", "hash", "message", "number", "parents".
kutils::json::Object documentOf(CommitRecord const& commit);

/// The author without the machine: what comes before the first '@'.
OdString authorName(CommitRecord const& commit);

/// "2024-03-05T14:07:09Z", as in documents.
std::string dateMember(std::int64_t seconds);
/// "2024-03-05 14:07:09 UTC"
std::string dateText(std::int64_t seconds);
/// "17 bytes", "20.3 MB"
std::string sizeText(std::uint64_t bytes);
/// A size, or two with an arrow between them; empty when neither is known.
std::string sizesText(std::optional<std::uint64_t> before, std::optional<std::uint64_t> after);

/// "new", "modified", "removed", "renamed"
std::string changeText(common::FileChange change, OdString const& previousPath);
/// "modified: plan.dwg", "renamed:  old.dwg -> new.dwg"
std::string changeLine(common::FileChange change, OdString const& path, OdString const& previousPath);

} // namespace tav
