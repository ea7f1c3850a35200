/// Versions of drawings that the user names, as pictures.
#pragma once

#include "host/pictures/image.h"
#include "host/repository/local_database.h"

#include <optional>
#include <string>

namespace tav {

/// A drawing and one of its versions.
struct DrawingVersion {
    OdString path;
    std::string label; ///< for people: "plan.dwg" or "plan.dwg (commit 3)"
    Image picture;
};

/// The drawing `typed` as it is in the working folder, or, unless `commit` is empty, as that commit has it. `typed` is
/// a path, or the end of the path of one file. Pictures of commits are kept in the user's cache. Throws `Failure` when
/// there is no such file, and when it has no picture.
DrawingVersion drawingVersion(
    common::RootPath const& root, LocalDatabase const& database, std::string const& typed, std::string const& commit);

/// The picture of the content at `url`, none when it has none. Throws `Failure` when it cannot be read.
std::optional<Image> storedPictureIfAny(common::RootPath const& root, OdString const& url);

/// Writes `image` as a PNG file. Throws `Failure`; a file that is not a PNG file is not overwritten.
void writePicture(Image const& image, std::string const& file);

/// Shows `image` where the terminal can; otherwise throws `Failure` with the advice to write a file.
void showPicture(Image const& image);

} // namespace tav
