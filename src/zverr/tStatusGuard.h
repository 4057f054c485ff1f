#pragma once

#include "zverr/errStatus.h"

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
    tStatusGuard() noexcept : zverr_Status(zverr_emptyStatus()) {}
    tStatusGuard(const tStatusGuard&) = delete;
    tStatusGuard& operator=(const tStatusGuard&) = delete;

    // NOLINTNEXTLINE(bugprone-exception-escape): it is what the guard is for
    ~tStatusGuard() noexcept(false)
    {
        if (code != 0 || json != nullptr) endScope();
    }

private:
    void endScope();
};

static_assert(sizeof(tStatusGuard) == sizeof(zverr_Status), "no further fields");

} // namespace zverr
