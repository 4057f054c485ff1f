#pragma once

#include "zverr/status.h"

namespace zverr {

// A status with a scope, for one call of a status-based function. At the end of the scope a failure
// in it is raised as an Exception; everything else is released. The scope is visible braces:
//
//     {
//         zverr::tStatusGuard status;
//         host->setFrequency(offsetPpb, &status);
//     }
//
// While another exception is propagating the guard raises nothing: its own failure is dropped.
struct tStatusGuard : zverr_Status {
    tStatusGuard() noexcept;
    tStatusGuard(const tStatusGuard&) = delete;
    tStatusGuard& operator=(const tStatusGuard&) = delete;
    ~tStatusGuard() noexcept(false); // NOLINT(bugprone-exception-escape): it is what it is for
};

static_assert(sizeof(tStatusGuard) == sizeof(zverr_Status), "no further fields");

} // namespace zverr
