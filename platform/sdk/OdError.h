/// The exception of the drawing SDK.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <exception>
#include <string>

/// Reasons of failure that have a number.
enum OdResult {
    eOk = 0,
    eOutOfMemory = 4,
};

/// A failure that cannot be handled where it arises. Carries a message for people.
class MU_PLATFORM_EXPORT OdError : public std::exception {
public:
    /// Carries `message`, which is finished and translated.
    explicit OdError(OdString const& message);
    /// The message is a fixed English sentence for `code`.
    explicit OdError(OdResult code);

    /// The message. Valid as long as the exception.
    OdString const& description() const noexcept { return message_; }
    /// `eOk` when the exception was made from a message.
    OdResult code() const noexcept { return code_; }
    /// The message in its narrow form.
    char const* what() const noexcept override { return narrow_.c_str(); }

private:
    OdString message_;
    std::string narrow_;
    OdResult code_ = eOk;
};
