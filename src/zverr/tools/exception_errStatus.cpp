#include "zverr/tools/exception_errStatus.h"

#include "zverr/Exception.h"
#include "zverr/errStatus.h"

#include <new>

namespace {

void takeActiveException(zverr_Status* status)
{
    try {
        throw;
    } catch (zverr::ExceptionBase& failure) {
        zverr_takeStatus(status, &failure.status);
    } catch (std::bad_alloc&) {
        zverr_setCode(status, zvplaterr_memoryFull);
    } catch (...) {
        zverr_setCode(status, zvplaterr_softwareFaultPLATInternalUseOnly);
    }
}

} // namespace

void zverr_exceptionToStatus(zverr_Status* status)
{
    try {
        takeActiveException(status);
    } catch (...) { // NOLINT(bugprone-empty-catch): a host's reallocJson threw; the code is stored
    }
}
