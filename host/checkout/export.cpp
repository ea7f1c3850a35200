#include "host/checkout/export.h"

#include "host/checkout/working_tree.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/storage/local_storage.h"
#include "host/terminal/progress.h"

#include "platform/os/os_batch.h"
#include "platform/os/os_files.h"

#include <filesystem>

namespace tav {

namespace {

namespace fs = std::filesystem;

void prepare(std::string const& target)
{
    std::error_code error = os::makeFolders(target, 0777);
    bool const isEmpty = !error && fs::is_empty(target, error);
    if (error) {
        throw Failure("'" + target + "' cannot be used: " + error.message() + ".", "Name another folder.");
    }
    if (!isEmpty) {
        throw Failure("'" + target + "' is not empty.", "Name a folder that is empty or does not exist yet.");
    }
}

/// What belongs to the repository itself would make the folder look like one.
bool isExported(OdString const& path)
{
    return path.left(5) != OdString(L".tav/");
}

void checkPaths(Tree const& files)
{
    for (auto const& [path, url] : files) {
        if (auto const fault = whyUnsafe(path)) {
            throw Failure(*fault, "Nothing has been written.");
        }
    }
}

} // namespace

std::size_t exportFiles(common::RootPath const& root, Tree const& files, std::string const& target)
{
    checkPaths(files);
    prepare(target);
    LocalStorage storage(root);
    os::Batch batch(target);
    Progress progress("files", files.size());
    std::string const incoming = target + "/.tav-export";
    std::size_t count = 0;
    for (auto const& [path, url] : files) {
        progress.advance();
        if (!isExported(path)) {
            continue;
        }
        extract(storage, {path, url}, incoming);
        if (std::error_code const error = batch.place(incoming, path.ansi_str())) {
            [[maybe_unused]] std::error_code const ignored = batch.remove(".tav-export");
            throw Failure("'" + path.ansi_str() + "' cannot be written: " + error.message() + ".", "Try again.");
        }
        ++count;
    }
    if (std::error_code const error = batch.flush()) {
        throw Failure("'" + target + "' cannot be flushed: " + error.message() + ".", "Check the disk.");
    }
    return count;
}

} // namespace tav
