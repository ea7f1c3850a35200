#include "common/mu_common_io_utils.h"

namespace common {

void IoInterface::message(OdString const& /*text*/) const {}

void IoInterface::progress(std::int64_t /*done*/, std::int64_t /*total*/) const {}

} // namespace common
