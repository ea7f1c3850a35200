/// Text files, read line by line and written whole.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <cstddef>
#include <vector>

namespace ut {

/// A text file held in memory as lines. One thread at a time. On disk the text is UTF-8 (see `OdString` for bytes that
/// are not).
class MU_PLATFORM_EXPORT TextFile {
public:
    /// Keeps the path, without a look at the disk.
    explicit TextFile(OdString const& path);

    /// Whether the path names a regular file, links followed.
    bool exists() const;

    /// Reads the whole file. A byte-order mark is skipped; a line ends with a line feed or with carriage return and
    /// line feed. False when the file cannot be read; there are no lines then.
    bool open();
    /// The first line, without its end; empty when there is none.
    OdString getFirstLine();
    /// The line after the one given last; empty past the last line.
    OdString getNextLine();

    /// Starts a new text without lines. The disk is untouched until `write`, so an interrupted creation leaves no empty
    /// file behind.
    void create();
    /// Appends a line. A line that holds line feeds is written as it stands.
    void addLine(OdString line);
    /// Writes the lines, joined with line feeds, none after the last. The old content is replaced as a whole and
    /// durably: after a crash, a full disk or any other failure the file holds the old content or the new. Permissions
    /// are kept, and a link stays and leads to the new content. True when the new content is safe on the disk.
    bool write();

private:
    OdString path_;
    std::vector<OdString> lines_;
    std::size_t next_ = 0;
};

} // namespace ut
