#include "host/repository/file_moves.h"

#include "host/failure.h"

#include "platform/os/os_move.h"

#include <filesystem>

namespace tav {

namespace {

bool entryExists(std::string const& path)
{
    std::error_code error;
    return std::filesystem::exists(std::filesystem::symlink_status(path, error));
}

} // namespace

FileMoves::~FileMoves()
{
    for (auto move = done_.rbegin(); move != done_.rend(); ++move) {
        try {
            [[maybe_unused]] std::error_code const ignored = os::moveEntry(top_, move->second, move->first);
        } catch (...) {
            // Nobody is left to tell; the file lies whole under its new name.
        }
    }
}

void FileMoves::move(std::string const& from, std::string const& to)
{
    std::string const fullFrom = top_ + "/" + from;
    std::string const fullTo = top_ + "/" + to;
    bool const wasThere = entryExists(fullFrom);
    done_.emplace_back(from, to);
    std::error_code const error = os::moveEntry(top_, from, to);
    if (!error) {
        return;
    }
    bool const hasMovedUnflushed = wasThere && !entryExists(fullFrom);
    if (!hasMovedUnflushed) {
        done_.pop_back();
    }
    if (error == std::errc::file_exists) {
        throw Failure("'" + fullTo + "' exists already.", "Choose another name, or move that one away first.");
    }
    throw Failure(
        "'" + fullFrom + "' cannot be moved to '" + fullTo + "': " + error.message() + ".",
        "Check that the folder exists and that you may write there.");
}

} // namespace tav
