#include "zverr/tStatusGuard.h"

#include "zverr/Exception.h"

namespace zverr {

void tStatusGuard::endScope()
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
