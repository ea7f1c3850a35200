#include "host/repository/open.h"
#include "host/cli/commands.h"
#include "host/cli/content_output.h"
#include "host/cli/opened_copy.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/storage/local_storage.h"

#include <filesystem>
#include <optional>
#include <string>

namespace tav {

namespace {

/// Without a commit, a name is that of a file of the current one.
FileOfCommit findFile(std::string const& typed, LocalDatabase const& database, common::RootPath const& root)
{
    auto file = findFileOfCommit(typed, database, root);
    try {
        file = file ? file : findFileOfCommit(":" + typed, database, root);
    } catch (Failure const&) {
        requireCommitOf(typed, database); // A name without a colon has none.
        throw;
    }
    if (!file) {
        throw Failure("There is no commit yet.", "Open the file itself.");
    }
    return *file;
}

void extractCopy(FileOfCommit const& file, std::string const& path, LocalStorage const& storage)
{
    auto const done = storage.extract(file.url, path);
    if (!done.hasValue()) {
        bool const isDamaged = !storage.verify(file.url).hasValue();
        valueOrFail(
            done, isDamaged ? "Run 'tav verify' to see what is damaged."
                            : "Check the free space for the folder 'tav' in XDG_CACHE_HOME, by default in '~/.cache'.");
    }
}

std::string copyOf(FileOfCommit const& file, common::RootPath const& root)
{
    auto const digest = digestOf(file.url);
    if (!digest) {
        throw Failure(
            "'" + file.path.ansi_str() + "' has no content here.", "Run 'tav verify' to see what is missing.");
    }
    std::string const name = std::filesystem::path(file.path.ansi_str()).filename().string();
    return makeReadOnlyCopy(name, "commit " + std::to_string(file.commit), *digest, [&](std::string const& path) {
        extractCopy(file, path, LocalStorage(root));
    });
}

} // namespace

void openFile(OpenOptions const& options)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    std::string const copy = copyOf(findFile(options.name, database, root), root);
    if (options.printsPath) {
        print(copy + "\n");
    } else {
        openWithProgram(copy);
    }
}

} // namespace tav
