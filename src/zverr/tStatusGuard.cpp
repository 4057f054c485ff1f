#include "zverr/tStatusGuard.h"

#include "zverr/Exception.h"
#include "zverr/errStatus.h"

namespace zverr {

tStatusGuard::tStatusGuard() noexcept : zverr_Status(zverr_emptyStatus()) {}

// NOLINTNEXTLINE(bugprone-exception-escape)
tStatusGuard::~tStatusGuard() noexcept(false)
{
    if (code >= 0 || std::uncaught_exceptions() > 0) {
        zverr_releaseJson(this);
        return;
    }
    Exception failure;
    zverr_takeStatus(&failure.status, this);
    zverr_releaseJson(this); // a host that put its own reallocJson in: the text was only copied
    throw failure;
}

} // namespace zverr
