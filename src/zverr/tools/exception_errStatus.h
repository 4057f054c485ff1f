#pragma once

#include "zverr/status.h"

// The bridge from exceptions to the host's status. To be called inside a handler only: it takes the
// active exception and puts into `status`, by the rule of zverr_setCode,
//   a zverr::Exception        its own code and payload,
//   an exhausted allocator    zvplaterr_memoryFull, with its what(),
//   a standard exception      zvplaterr_softwareFaultPLATInternalUseOnly, with its what(),
//   anything else             zvplaterr_softwareFaultPLATInternalUseOnly.
// It returns normally whatever happens, a host's throwing reallocJson included.
void zverr_exceptionToStatus(zverr_Status* status);
