#pragma once

#include "zvplat/tFixedStatus.h"

namespace zvplat {

// A fixed record with a scope, as zverr::tStatusGuard is a status with one: at the end of the scope
// a failure in it is raised as a zverr::Exception, unless another exception is propagating.
struct tFixedStatusGuard : tFixedStatus {
    tFixedStatusGuard() = default;
    tFixedStatusGuard(const tFixedStatusGuard&) = delete;
    tFixedStatusGuard& operator=(const tFixedStatusGuard&) = delete;
    // NOLINTNEXTLINE(bugprone-exception-escape): it is what the guard is for
    ~tFixedStatusGuard() noexcept(false);

    // For a guard whose scope is a single expression.
    tFixedStatus* get() { return this; }
};

static_assert(sizeof(tFixedStatusGuard) == sizeof(tFixedStatus), "no further fields");

} // namespace zvplat
