#include "zverr/tools/exception_errStatus.h"

#include "zverr/Exception.h"
#include "zverr/errStatus.h"
#include "zverr/payload.h"

#include <new>

namespace {

void addWhat(zverr_JsonWriter writer, const std::exception& exception)
{
    const char* const what = exception.what(); // of a host's class it may be anything
    writer.addString("std_exception_what", what != nullptr ? what : "");
}

void takeActiveException(zverr_Status* status)
{
    try {
        throw;
    } catch (zverr::ExceptionBase& failure) {
        zverr_takeStatus(status, &failure.status);
    } catch (std::bad_alloc& exhausted) {
        addWhat(zverr_setFailure(status, zverr::kAtBadAlloc), exhausted);
    } catch (std::exception& other) {
        addWhat(zverr_setFailure(status, zverr::kAtStandardException), other);
    } catch (...) {
        zverr_setFailure(status, zverr::kAtUnknownException);
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
