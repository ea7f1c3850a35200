/// Errors that a client tells apart by their code.
#pragma once

#include "host/errors/failure.h"
#include "host/protocol/server.h"

#include <string>
#include <utility>

namespace tav {

/// What a server throws when it refuses a request.
inline Failure refusal(ServerError code, std::string what, std::string next)
{
    Failure failure(std::move(what), std::move(next));
    failure.code = static_cast<std::int32_t>(code);
    return failure;
}

} // namespace tav
