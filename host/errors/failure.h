/// How a command fails.
#pragma once

#include "common/mu_common_expected.h"

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace tav {

/// Ends a command. `what` says what failed, and `next` what the user can do about it; each is a sentence in UTF-8.
struct Failure {
    Failure(std::string what_, std::string next_) : what(std::move(what_)), next(std::move(next_)) {}
    Failure(ErrorMessage const& error, std::string next_) : Failure(error.message.ansi_str(), std::move(next_))
    {
        code = error.code;
    }

    std::string what;
    std::string next;
    std::vector<std::string> details; ///< lines that follow, such as names to choose from
    std::int32_t code = 0;            ///< of an error whose kind the caller has to know, else 0
};

/// The value of `result`; its error becomes the failure of the command.
template <class T>
T valueOrFail(Expected<T> result, std::string const& next)
{
    if (!result.hasValue()) {
        throw Failure(result.error(), next);
    }
    return std::move(result).visit(GetRValueOrThrow<T>{});
}

} // namespace tav
