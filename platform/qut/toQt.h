/// Conversion to Qt's strings.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <QString>

namespace qut {

/// `text` in UTF-16. Characters that stand for bytes of a file name stay what they are, as lone surrogates.
MU_PLATFORM_EXPORT QString toQt(OdString const& text);

} // namespace qut
