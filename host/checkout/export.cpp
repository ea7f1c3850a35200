#include "host/checkout/export.h"

#include "host/checkout/working_tree.h"
#include "host/client/contents.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/storage/local_storage.h"
#include "host/terminal/progress.h"

#include "platform/os/os_batch.h"
#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <filesystem>
#include <iterator>
#include <vector>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kIncoming = "/.tav-export";

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
Tree withoutOwnFiles(Tree files)
{
    for (auto file = files.begin(); file != files.end();) {
        bool const isOwn = file->first.left(5) == OdString(L".tav/");
        file = isOwn ? files.erase(file) : std::next(file);
    }
    return files;
}

void checkPaths(Tree const& files)
{
    for (auto const& [path, url] : files) {
        if (auto const fault = whyUnsafe(path)) {
            throw Failure(*fault, "Nothing has been written.");
        }
    }
}

/// A folder that was empty before is empty again.
void takeBack(std::vector<OdString> const& written, std::string const& target)
{
    std::error_code ignored;
    fs::remove(target + kIncoming, ignored);
    for (OdString const& path : written) {
        fs::path place = fs::path(target) / path.ansi_str();
        fs::remove(place, ignored);
        while ((place = place.parent_path()) != target && fs::remove(place, ignored)) { // Fails for one that has files.
        }
    }
}

void exportTo(std::string const& target, LocalStorage& storage, Tree const& files, std::vector<OdString>& written)
{
    os::Batch batch(target);
    Progress progress("files", files.size());
    for (auto const& [path, url] : files) {
        progress.advance();
        extract(storage, {path, url}, target + kIncoming);
        written.push_back(path);
        if (std::error_code const error = batch.place(target + kIncoming, path.ansi_str())) {
            throw Failure("'" + path.ansi_str() + "' cannot be written: " + error.message() + ".", "Try again.");
        }
    }
    if (std::error_code const error = batch.flush()) {
        throw Failure("'" + target + "' cannot be flushed: " + error.message() + ".", "Check the disk.");
    }
}

std::error_code flushNew(std::string const& path)
{
    os::OpenFile file;
    if (std::error_code const error = file.openForChanging(path)) {
        return error;
    }
    std::error_code const error = file.flush();
    return error ? error : os::flushFolder(fs::path(path).parent_path().string());
}

} // namespace

std::size_t
exportFiles(common::RootPath const& root, LocalDatabase const& database, Tree const& files, std::string const& target)
{
    checkPaths(files);
    Tree const exported = withoutOwnFiles(files);
    LocalStorage storage(root);
    requireHere(exported, database, storage);
    prepare(target);
    std::vector<OdString> written;
    try {
        exportTo(target, storage, exported, written);
    } catch (...) {
        takeBack(written, target);
        throw;
    }
    return written.size();
}

void exportFile(
    common::RootPath const& root, LocalDatabase const& database, Tree::value_type const& file,
    std::string const& target)
{
    LocalStorage storage(root);
    requireHere({file}, database, storage);
    extract(storage, file, target);
    if (std::error_code const error = flushNew(target)) {
        std::error_code ignored;
        fs::remove(target, ignored);
        throw Failure("'" + target + "' cannot be written: " + error.message() + ".", "Name another file.");
    }
}

} // namespace tav
