#include "host/checkout/file_moves.h"

#include "host/errors/failure.h"

#include "platform/os/os_move.h"

#include <filesystem>

namespace tav {

namespace {

[[noreturn]] void failForExisting(std::string const& path)
{
    throw Failure("'" + path + "' exists already.", "Choose another name, or move that one away first.");
}

} // namespace

FileMoves::~FileMoves()
{
    for (auto move = done_.rbegin(); move != done_.rend(); ++move) {
        try {
            bool hasMoved = false;
            [[maybe_unused]] std::error_code const ignored = os::moveEntry(top_, move->second, move->first, hasMoved);
        } catch (...) {
            // Nobody is left to tell; the file lies whole under its new name.
        }
    }
}

void FileMoves::requireFree(std::string const& to) const
{
    std::string const full = top_ + "/" + to;
    std::error_code ignored;
    if (std::filesystem::exists(std::filesystem::symlink_status(full, ignored))) {
        failForExisting(full);
    }
}

void FileMoves::move(std::string const& from, std::string const& to)
{
    done_.emplace_back(from, to); // First: afterwards there may be no memory for it.
    bool hasMoved = false;
    std::error_code error;
    try {
        error = os::moveEntry(top_, from, to, hasMoved);
    } catch (...) {
        done_.pop_back();
        throw;
    }
    if (!hasMoved) {
        done_.pop_back();
    }
    if (!error) {
        return;
    }
    std::string const fullFrom = top_ + "/" + from;
    std::string const fullTo = top_ + "/" + to;
    if (error == std::errc::file_exists) {
        failForExisting(fullTo);
    }
    throw Failure(
        "'" + fullFrom + "' cannot be moved to '" + fullTo + "': " + error.message() + ".",
        "Check that the folder exists and that you may write there.");
}

} // namespace tav
