#include "host/checkout/export.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/restored_files.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <filesystem>
#include <optional>
#include <string>
#include <utility>

namespace tav {

namespace {

namespace fs = std::filesystem;

std::string resultOf(std::size_t files, std::size_t written, std::int64_t commit)
{
    std::string const where = "as in commit " + std::to_string(commit);
    return written == 0 ? "Nothing to restore: already " + where + ".\n"
                        : counted(files, "file") + " " + where + ", " + std::to_string(written) + " written.\n";
}

void restore(RestoreOptions const& options)
{
    Discard const discard = options.force ? Discard::everything : Discard::copies;
    if (options.dryRun) {
        common::RootPath const root = openRepository("");
        LocalDatabase const database = LocalDatabase::open(root);
        previewRestored(findRestoredFiles(options.commit, options.names, root, database), discard, root, database);
        return;
    }
    WriteSession session(openRepository(""), "restore", Recovery::attempted);
    RestoredFiles const restored = findRestoredFiles(options.commit, options.names, session.root(), session.database());
    std::size_t const written = writeRestored(restored, discard, typedCommand("restore", options.names), session);
    report(resultOf(restored.files.size(), written, restored.commit.number));
}

/// Into a folder that exists, a file keeps its name. Links to folders are followed to where they lead.
std::string targetOf(std::string const& typed, OdString const& path)
{
    fs::path const target = fs::is_directory(typed) ? typed / fs::path(path.ansi_str()).filename() : fs::path(typed);
    fs::path const folder = fs::weakly_canonical(fs::absolute(target).parent_path());
    if (!target.has_filename()) {
        throw Failure("There is no folder '" + typed + "'.", "Make it first.");
    }
    return (folder / target.filename()).string();
}

/// The path of `target` in the repository; none when it is elsewhere.
std::optional<OdString> pathInside(std::string const& target, common::RootPath const& root)
{
    std::string const top = fs::canonical(root.path().ansi_str()).string() + "/";
    return target.compare(0, top.size(), top) == 0 ? std::optional(fromUtf8(target.substr(top.size()))) : std::nullopt;
}

bool isOwnFolder(fs::path const& path)
{
    std::error_code ignored;
    return path.filename() == ".tav" || fs::exists(path / "server.db", ignored);
}

/// A history or a storage that a drawing has overwritten is lost, and nothing here could bring it back.
void requireNotInOwnFolder(std::string const& target)
{
    for (fs::path path = target; path.has_relative_path(); path = path.parent_path()) {
        if (isOwnFolder(path)) {
            throw Failure(
                "'" + path.string() + "' belongs to a repository or a server.",
                "Nothing has been written; name another path.");
        }
    }
}

/// What is overwritten in the repository can be brought back; nothing else is.
void requireFree(std::string const& target, bool isInside, bool force)
{
    if (!fs::exists(fs::symlink_status(target)) || (isInside && force)) {
        return;
    }
    throw Failure(
        "'" + target + "' is there already.",
        isInside ? "Name another path, or overwrite it with --force."
                 : "Outside of the repository nothing is overwritten; name another path, or move or remove it first.");
}

/// One file, and another place for it.
struct Copy {
    RestoredFiles restored;
    std::string target; ///< full path, in bytes
};

Copy findCopy(RestoreOptions const& options, common::RootPath const& root, LocalDatabase const& database)
{
    RestoredFiles restored = findRestoredFiles(options.commit, options.names, root, database);
    if (restored.files.size() != 1) {
        throw Failure(
            "--to takes one file, and these are " + std::to_string(restored.files.size()) + ".",
            "Use 'tav export' for the files of a commit.");
    }
    std::string const target = targetOf(*options.target, restored.files.begin()->first);
    requireNotInOwnFolder(target);
    requireFree(target, pathInside(target, root).has_value(), options.force);
    return {std::move(restored), target};
}

std::string described(Copy const& copy)
{
    return "'" + shown(copy.restored.files.begin()->first) + "' of commit " +
           std::to_string(copy.restored.commit.number) + " to '" + shown(fromUtf8(copy.target)) + "'.\n";
}

void copyInside(Copy const& copy, OdString const& path, RestoreOptions const& options, common::RootPath const& root)
{
    RestoredFiles const restored{copy.restored.commit, {{path, copy.restored.files.begin()->second}}};
    Discard const discard = options.force ? Discard::everything : Discard::nothing;
    if (options.dryRun) {
        previewRestored(restored, discard, root, LocalDatabase::open(root));
        return;
    }
    WriteSession session(root, "restore", Recovery::attempted);
    writeRestored(
        restored, discard, typedCommand("restore", {options.names.front(), "--to", path.ansi_str()}), session);
    report("Wrote " + described(copy));
}

void copyOutside(Copy const& copy, RestoreOptions const& options, common::RootPath const& root)
{
    std::string const folder = fs::path(copy.target).parent_path().string();
    if (!fs::is_directory(folder)) {
        throw Failure("There is no folder '" + folder + "'.", "Make it first.");
    }
    if (options.dryRun) {
        print("Would write " + described(copy));
        return;
    }
    exportFile(root, LocalDatabase::open(root), *copy.restored.files.begin(), copy.target);
    report("Wrote " + described(copy));
}

void restoreTo(RestoreOptions const& options)
{
    common::RootPath const root = openRepository("");
    Copy const copy = findCopy(options, root, LocalDatabase::open(root));
    if (auto const path = pathInside(copy.target, root)) {
        copyInside(copy, *path, options, root);
    } else {
        copyOutside(copy, options, root);
    }
}

} // namespace

void restoreFiles(RestoreOptions const& options)
{
    if (options.target) {
        restoreTo(options);
    } else {
        restore(options);
    }
}

} // namespace tav
