# The headers that users of the library see, by their include lines: what is installed, and what must compile alone.

# Not for users: these headers of common/ serve its own sources only.
set(MU_INTERNAL_HEADERS
    common/mu_common_document.h
    common/mu_common_expression.h
    common/mu_common_expression_cost.h
    common/mu_common_expression_ways.h
    common/mu_common_pattern.h
    common/mu_common_state_document.h
    common/mu_common_translate.h)

file(GLOB MU_PLATFORM_HEADERS CONFIGURE_DEPENDS RELATIVE "${PROJECT_SOURCE_DIR}"
    "${PROJECT_SOURCE_DIR}/platform/*.h"
    "${PROJECT_SOURCE_DIR}/platform/sdk/*.h"
    "${PROJECT_SOURCE_DIR}/platform/ut/*.h"
    "${PROJECT_SOURCE_DIR}/platform/qut/*.h")

file(GLOB MU_COMMON_HEADERS CONFIGURE_DEPENDS RELATIVE "${PROJECT_SOURCE_DIR}"
    "${PROJECT_SOURCE_DIR}/json/*.h"
    "${PROJECT_SOURCE_DIR}/common/*.h")
list(REMOVE_ITEM MU_COMMON_HEADERS ${MU_INTERNAL_HEADERS})

# The library of preview pictures is a package of its own.
set(MU_PREVIEW_HEADERS preview/mu_preview.h)
