#include "support/raisedBy.h"

#include "support/tHostStatus.h"
#include "zverr/Exception.h"

std::string raisedBy(const std::function<void()>& call)
{
    try {
        call();
    } catch (const zverr::Exception& failure) {
        expectBufferForm(failure.status);
        return std::to_string(failure.status.code) + " " + failure.what();
    }
    return "";
}
