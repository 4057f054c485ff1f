#pragma once

#include "zvplat/tFixedStatus.h"

#include <cstddef>

namespace zvplat {

// An array of `size` bytes, to be released with delete[]; null, and a failure in `status`, if there
// is no memory. Null as well if `status` holds a failure already. Never throws.
char* newArray(size_t size, tFixedStatus* status);

} // namespace zvplat
