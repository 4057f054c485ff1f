#pragma once

#include "zverr/status.h"

#include <cstddef>

// The memory of the containers in this folder: it never throws and reports through a status.

namespace zvktl::err {

// Memory for a container, or null and zvplaterr_memoryFull in `status`.
void* allocate(size_t bytes, zverr_Status* status);
// Gives it back; null is none.
void release(void* memory);

// What every container reports that cannot have its size.
void reportMemoryFull(zverr_Status* status);

} // namespace zvktl::err
