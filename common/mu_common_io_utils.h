/// The seam through which the library hands decisions and outcomes back to the host.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"

#include "platform/sdk/OdString.h"

#include <cstdint>

namespace common {

/// The host derives from this and passes its instance by reference to the objects that save themselves (`Cache`,
/// `Config`) and to `FileStorage::merge`. They keep its address: the instance stays the host's and must outlive every
/// object that it was given to.
///
/// Calls come on the thread that destroys the saving object or that merges; the library takes no lock around them.
class MU_COMMON_EXPORT IoInterface {
public:
    /// Shows a message. The library never calls it; it is the host's to use.
    virtual void message(OdString const& text) const;

    /// Asks whether to go on with `path`; any value but zero means yes.
    virtual std::int32_t accept(OdString const& path) const = 0;

    /// Shows how far a work has come. The library never calls it; it is the host's to use.
    virtual void progress(std::int64_t done, std::int64_t total) const;

    /// Takes the outcome of an end-of-life save: called exactly once by each object that had something to save, after
    /// the attempt. Objects without changes call nothing. Must not throw, since it runs inside a destructor.
    virtual void report(WriteOutcome const& outcome) const = 0;

protected:
    IoInterface() = default;
    IoInterface(IoInterface const&) = default;
    IoInterface& operator=(IoInterface const&) = default;
    ~IoInterface() = default;
};

} // namespace common
