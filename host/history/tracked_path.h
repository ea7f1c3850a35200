/// Paths of files as documents record them: everything that is read from a server, a state file or a database goes
/// through here before a file is looked up or written by it. Any thread.
///
/// A recorded path is relative to the working folder, with '/' between its parts. What is refused is refused on every
/// system, so that a commit that one system takes can be checked out on all: names that end or leave a folder elsewhere
/// are no names here either.
#pragma once

#include "platform/sdk/OdString.h"

#include <optional>
#include <string>

namespace tav {

/// None for a path that may be used; else one sentence, which quotes the path and says what is wrong with it.
///
/// Refused are: the empty path; absolute paths, drives and backslashes; parts that are empty or of nothing but dots and
/// blanks, "." and ".." among them; control characters and line ends; characters that do not come back from the disk as
/// they were; parts of more than 255 bytes and paths of more than 4,096; and the repository's own folder ".tav" under
/// every name that some file system takes for it: letter case, invisible characters, compatibility forms, dots and
/// blanks at the end, short names, streams. Of its content only files below ".tav/properties", spelled so, may be
/// recorded.
///
/// Hidden names and names that begin with a dash may be used.
std::optional<std::string> whyUnsafe(OdString const& path);

/// None when nothing on the way from the folder `root` (in bytes) to `path` leads elsewhere; else one sentence that
/// names the first part, the last one included, that is a symbolic link, or that should be a folder and is none.
/// Who gets a sentence writes nothing. What does not exist yet is no obstacle. `path` has passed `whyUnsafe`; `root`
/// itself may be a link.
std::optional<std::string> linkOnTheWay(std::string const& root, OdString const& path);

} // namespace tav
