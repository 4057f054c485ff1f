#include "zverr/Exception.h"

#include "zverr/errStatus.h"
#include "zverr/payload.h"

namespace zverr {

ExceptionBase::ExceptionBase() noexcept : status(zverr_emptyStatus()) {}

ExceptionBase::ExceptionBase(const ExceptionBase& other) noexcept : status(zverr_emptyStatus())
{
    zverr_takeStatus(&status, &other.status);
}

ExceptionBase::~ExceptionBase() noexcept { zverr_releaseJson(&status); }

const char* ExceptionBase::what() const noexcept
{
    return status.json != nullptr ? status.json : "";
}

Exception::Exception(const Exception& other) noexcept : ExceptionBase(other), std::exception(other)
{}

Exception::~Exception() noexcept = default;

const char* Exception::what() const noexcept { return ExceptionBase::what(); }

void raise(const zverr_RaisingSite& site)
{
    Exception failure;
    zverr_setFailure(&failure.status, site);
    throw failure;
}

} // namespace zverr
