#pragma once

#include "zverr/errStatus.h"

namespace zverr {

// A status that starts clean and gives its payload back at the end of its scope, raising nothing.
struct tLocalStatus : zverr_Status {
    tLocalStatus() : zverr_Status(zverr_emptyStatus()) {}
    tLocalStatus(const tLocalStatus&) = delete;
    tLocalStatus& operator=(const tLocalStatus&) = delete;
    ~tLocalStatus() { zverr_releaseJson(this); }
};

} // namespace zverr
