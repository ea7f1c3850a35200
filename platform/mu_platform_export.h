/// MU_PLATFORM_EXPORT marks what libmu_platform shows to its users; everything else in it is hidden.
#pragma once

#define MU_PLATFORM_EXPORT __attribute__((visibility("default")))
