#include "zvplat/tFixedStatusGuard.h"

#include "zverr/Exception.h"

namespace zvplat {

// NOLINTNEXTLINE(bugprone-exception-escape): it is what the guard is for
tFixedStatusGuard::~tFixedStatusGuard() noexcept(false)
{
    if (code >= 0 || std::uncaught_exceptions() > 0) return;
    zverr::Exception failure;
    zverr_takeFixedStatus(*this, &failure.status);
    throw failure;
}

} // namespace zvplat
