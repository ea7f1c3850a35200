#include "host/cli/commands.h"
#include "host/cli/drawing_version.h"
#include "host/cli/output.h"
#include "host/repository/open.h"
#include "host/text/utf8.h"

#include "platform/ut/FileName.h"

#include <string>
#include <utility>

namespace tav {

namespace {

/// "NAME@COMMIT" as its two parts. The name of a file in the working folder may hold the sign itself.
std::pair<std::string, std::string> nameAndCommit(std::string const& typed)
{
    std::size_t const sign = typed.rfind('@');
    if (sign == std::string::npos || ut::FileName::fileExists(fromUtf8(typed))) {
        return {typed, ""};
    }
    return {typed.substr(0, sign), typed.substr(sign + 1)};
}

} // namespace

void showPreview(PreviewOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    auto const [name, commit] = nameAndCommit(options.name);
    DrawingVersion const version = drawingVersion(root, database, name, commit);
    if (options.file.empty()) {
        showPicture(version.picture);
        return;
    }
    writePicture(version.picture, options.file);
    if (options.json) {
        kutils::json::Object document;
        document[L"path"] = jsonText(version.path);
        document[L"file"] = jsonText(fromUtf8(options.file));
        document[L"width"] = std::uint64_t{version.picture.width()};
        document[L"height"] = std::uint64_t{version.picture.height()};
        printJson(std::move(document));
    } else {
        print(
            "Wrote the picture of " + version.label + ", " + std::to_string(version.picture.width()) + " x " +
            std::to_string(version.picture.height()) + " pixels, to '" + shown(fromUtf8(options.file)) + "'.\n");
    }
}

} // namespace tav
