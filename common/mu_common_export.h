/// MU_COMMON_EXPORT marks what the library shows to its users; everything else in it is hidden.
#pragma once

#define MU_COMMON_EXPORT __attribute__((visibility("default")))
