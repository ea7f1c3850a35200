/// KUTILS_JSON_EXPORT marks what the JSON layer shows to users of the library that it is packed into.
#pragma once

#define KUTILS_JSON_EXPORT __attribute__((visibility("default")))
