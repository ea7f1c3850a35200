/// Renaming of working files that is undone unless the command succeeds.
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace tav {

/// Moves entries, and moves them back in reverse order when it is destroyed without `keep`. Paths are below the folder
/// `top`, in bytes, and lead through no link.
class FileMoves {
public:
    explicit FileMoves(std::string top) : top_(std::move(top)) {}
    FileMoves(FileMoves const&) = delete;
    FileMoves& operator=(FileMoves const&) = delete;
    ~FileMoves();

    /// Throws `Failure` when `to` exists.
    void requireFree(std::string const& to) const;
    /// Throws `Failure` when `to` exists or the system refuses.
    void move(std::string const& from, std::string const& to);
    void keep() { done_.clear(); }

private:
    std::string top_;
    std::vector<std::pair<std::string, std::string>> done_;
};

} // namespace tav
