/// Checks the paths of files in documents. Every path that is read from a server, a state file or a database is checked
/// here before it is used to find or write a file. Any thread.
///
/// A recorded path is relative to the working folder, with '/' between its parts. The same paths are refused on every
/// system, so that a commit made on one can be checked out on all. That includes names that another system would read
/// as a separator, a parent folder or another name.
#pragma once

#include "platform/sdk/OdString.h"

#include <optional>
#include <string>

namespace tav {

/// None for a path that may be used; else one sentence, which quotes the path and says what is wrong with it.
///
/// Refused are: the empty path; absolute paths, drives and backslashes; parts that are empty or consist of dots and
/// blanks, including "." and ".."; control characters and line ends; characters that the disk would not return
/// unchanged; parts of more than 255 bytes and paths of more than 4,096; and the repository's own folder ".tav" under
/// every name that some file system treats as the same: letter case, invisible characters, compatibility forms, dots
/// and blanks at the end, short names, streams. Inside it, only files below ".tav/properties", in exactly this
/// spelling, may be recorded.
///
/// Hidden names and names that begin with a dash may be used.
std::optional<std::string> whyUnsafe(OdString const& path);

/// None when no part of `path` below the folder `root` (in bytes) leads elsewhere; else one sentence that names the
/// first part, the last one included, that is a symbolic link, or that should be a folder but is not.
/// A caller that gets a sentence must not write. Parts that do not exist yet are allowed. `path` has passed
/// `whyUnsafe`; `root` itself may be a link.
std::optional<std::string> linkOnTheWay(std::string const& root, OdString const& path);

} // namespace tav
