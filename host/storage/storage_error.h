/// The exception that the parts of the storage use internally.
#pragma once

#include <string>
#include <system_error>
#include <utility>

namespace tav {

/// Thrown inside the storage; `LocalStorage` turns it into the error of its results. `what` is a sentence in UTF-8.
struct StorageError {
    explicit StorageError(std::string what_, int code_ = 0) : what(std::move(what_)), code(code_) {}

    std::string what;
    int code; ///< of the system, as in `errno`; 0 when the content is wrong
};

/// Throws if `error` is an error. `what` begins the sentence, and the system's reason ends it.
inline void check(std::error_code const& error, std::string const& what)
{
    if (error) {
        throw StorageError(what + ": " + error.message() + ".", error.value());
    }
}

} // namespace tav
