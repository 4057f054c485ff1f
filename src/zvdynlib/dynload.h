#pragma once

#include "zverr/status.h"

// The dynamic loader, with a full report of a failure. With one status for both, a load and a
// look-up need no test in between.

// Opens a library; `flag` goes to dlopen as it is. The handle is the caller's, who closes it. Null,
// and zvplaterr_invalidParameter in `status`, if the loader refuses; null and nothing else if
// `status` holds a failure already.
void* zvdynlib_load(const char* path, int flag, zverr_Status* status);

// The address of a symbol, under the same rule. A symbol at address null counts as not found.
void* zvdynlib_symbol(void* handle, const char* symbol, zverr_Status* status);

// Closes a library; `handle` is not null. The loader's result: 0 if it did.
int zvdynlib_close(void* handle);
