/// What the library reports about saving.
#pragma once

#include "host/errors/failure.h"

#include "common/mu_common_io_utils.h"

#include <optional>
#include <string>

namespace tav {

/// Keeps what an object reported when it went.
class SaveReport final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override { outcome_ = outcome; }

    bool hasFailed() const { return outcome_ && !outcome_->hasValue(); }

    /// Throws the error as `Failure`; one that nobody reported is none.
    void failUnlessSaved(std::string const& next) const
    {
        if (hasFailed()) {
            throw Failure(outcome_->error(), next);
        }
    }

private:
    mutable std::optional<WriteOutcome> outcome_;
};

} // namespace tav
