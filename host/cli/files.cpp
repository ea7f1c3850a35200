#include "host/changes/changes.h"
#include "host/changes/digest.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/terminal/progress.h"
#include "host/text/utf8.h"

#include <unistd.h>

#include <optional>
#include <string>
#include <vector>

namespace tav {

namespace {

struct Listed {
    OdString path;
    std::optional<Digest> digest;
};

/// Digests the files in order. One that cannot be read is reported and left without a digest.
std::vector<Listed> digestAll(common::RootPath const& root, std::vector<common::File> const& files)
{
    std::vector<Listed> list;
    Progress progress("files", files.size());
    for (common::File const& file : files) {
        list.push_back({file.path, fileDigest(root.pathTo(file.path))});
        progress.advance();
    }
    return list;
}

/// The form of sha256sum, so that it can check the list: a name with a line end or a backslash is escaped, and its line
/// begins with a backslash.
std::string digestLine(Digest const& digest, OdString const& path)
{
    std::string name;
    for (char const c : path.ansi_str()) {
        name += c == '\\' ? "\\\\" : c == '\n' ? "\\n" : c == '\r' ? "\\r" : std::string(1, c);
    }
    bool const isEscaped = name.size() != path.ansi_str().size();
    bool const isTerminal = isatty(STDOUT_FILENO) == 1;
    return (isEscaped ? "\\" : "") + hexOf(digest) + "  " + (isTerminal ? shown(path) : name) + "\n";
}

kutils::json::Value documentOf(std::vector<Listed> const& list, bool hash)
{
    kutils::json::Array array;
    for (Listed const& file : list) {
        kutils::json::Object object;
        object[L"path"] = jsonText(file.path);
        if (hash) {
            object[L"sha256"] = file.digest ? jsonText(fromUtf8(hexOf(*file.digest))) : kutils::json::Value();
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

void printLines(std::vector<Listed> const& list, bool hash)
{
    for (Listed const& file : list) {
        if (!hash) {
            print(shown(file.path) + "\n");
        } else if (file.digest) {
            print(digestLine(*file.digest, file.path));
        }
    }
}

void failForUnread(std::vector<Listed> const& list)
{
    std::size_t unread = 0;
    for (Listed const& file : list) {
        if (!file.digest) {
            ++unread;
            printError("'" + file.path.ansi_str() + "' cannot be read.", "Check your rights to it.");
        }
    }
    if (unread > 0) {
        throw Failure(
            std::to_string(unread) + " of " + std::to_string(list.size()) + " files could not be read.",
            "Mend that and run the command again.");
    }
}

} // namespace

void listFiles(FilesOptions const& options)
{
    common::RootPath const root = openRepository(options.folder);
    std::vector<common::File> const files = scan(root);
    std::vector<Listed> list;
    if (options.hash) {
        list = digestAll(root, files);
    } else {
        for (common::File const& file : files) {
            list.push_back({file.path, std::nullopt});
        }
    }
    if (options.json) {
        printJson(documentOf(list, options.hash));
    } else {
        printLines(list, options.hash);
    }
    if (options.hash) {
        failForUnread(list);
    }
}

} // namespace tav
