/// How the parts of the storage fail among themselves.
#pragma once

#include <string>
#include <system_error>
#include <utility>

namespace tav {

/// Thrown inside the storage; `LocalStorage` turns it into the error of its results. `what` is a sentence in UTF-8.
struct StorageError {
    explicit StorageError(std::string what_) : what(std::move(what_)) {}

    std::string what;
};

/// Throws unless `error` is none. `what` begins the sentence that the system's reason ends.
inline void check(std::error_code const& error, std::string const& what)
{
    if (error) {
        throw StorageError(what + ": " + error.message() + ".");
    }
}

} // namespace tav
