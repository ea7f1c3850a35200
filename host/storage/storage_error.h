/// How the parts of the storage fail among themselves.
#pragma once

#include <string>
#include <system_error>
#include <utility>

namespace tav {

/// Thrown inside the storage; `LocalStorage` turns it into the error of its results. `what` is a sentence in UTF-8.
struct StorageError {
    explicit StorageError(std::string what_, int code_ = 0) : what(std::move(what_)), code(code_) {}

    std::string what;
    int code; ///< of the system, as in `errno`; 0 when it is the content that is wrong
};

/// Throws unless `error` is none. `what` begins the sentence that the system's reason ends.
inline void check(std::error_code const& error, std::string const& what)
{
    if (error) {
        throw StorageError(what + ": " + error.message() + ".", error.value());
    }
}

} // namespace tav
