#include "zverr/tools/exception_errStatus.h"

#include "zverr/Exception.h"
#include "zverr/errStatus.h"
#include "zverr/payload.h"

#include <new>

namespace {

const char* const kWhat = "std_exception_what";

void takeActiveException(zverr_Status* status)
{
    try {
        throw;
    } catch (zverr::ExceptionBase& failure) {
        zverr_takeStatus(status, &failure.status);
    } catch (std::bad_alloc& exhausted) {
        zverr_setFailure(status, kAtBadAlloc).addString(kWhat, exhausted.what());
    } catch (std::exception& other) {
        zverr_setFailure(status, kAtStandardException).addString(kWhat, other.what());
    } catch (...) {
        zverr_setFailure(status, kAtUnknownException);
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
