#include "host/cli/commands.h"
#include "host/cli/drawing_version.h"
#include "host/cli/opened_copy.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/pictures/comparison.h"
#include "host/pictures/png_file.h"
#include "host/repository/open.h"
#include "host/text/utf8.h"

#include "common/mu_common_versions.h"
#include "platform/os/os_open_file.h"

#include <filesystem>
#include <string>

namespace tav {

namespace {

kutils::json::Object documentOf(Comparison const& comparison, DrawingVersion const& after, std::string const& file)
{
    kutils::json::Object document;
    document[L"path"] = jsonText(after.path);
    document[L"file"] = jsonText(fromUtf8(file));
    document[L"removed"] = comparison.removed;
    document[L"added"] = comparison.added;
    document[L"recolored"] = comparison.recolored;
    return document;
}

std::string summary(Comparison const& comparison)
{
    if (comparison.removed + comparison.added + comparison.recolored == 0) {
        return "The pictures are identical; the drawings may still differ.\n";
    }
    return "Pixels that differ: " + std::to_string(comparison.removed) + " removed, " +
           std::to_string(comparison.added) + " added, " + std::to_string(comparison.recolored) + " recolored.\n";
}

void openPicture(Image const& picture, OdString const& drawing)
{
    std::string const png = encodePng(picture);
    common::ContentDigest digest;
    digest.update(png.data(), png.size());
    std::string const name = std::filesystem::path(drawing.ansi_str()).stem().string() + ".png";
    openWithProgram(makeReadOnlyCopy(name, "compared", finish(digest), [&](std::string const& path) {
        os::OpenFile file;
        std::error_code error = file.create(path, 0600);
        error = error ? error : file.writeAt(0, png);
        if (error) {
            throw Failure("'" + path + "' cannot be written: " + error.message() + ".", "Check the free space.");
        }
    }));
}

} // namespace

void compareDrawing(CompareOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    DrawingVersion const before = drawingVersion(root, database, options.name, options.before);
    DrawingVersion const after = drawingVersion(root, database, options.name, options.after);
    Comparison const comparison = compare(before.picture, after.picture);
    if (options.open) {
        openPicture(comparison.picture, after.path);
    } else if (options.file.empty()) {
        showPicture(comparison.picture);
    } else {
        writePicture(comparison.picture, options.file);
    }
    if (options.json) {
        printJson(documentOf(comparison, after, options.file));
        return;
    }
    print(before.label + " and " + after.label + ". " + summary(comparison));
    if (!options.file.empty()) {
        report("Wrote the comparison to '" + shown(fromUtf8(options.file)) + "'.\n");
    }
}

} // namespace tav
