#include "dravik/tServo.h"
#include "zverr/Exception.h"

// The three operations on JSON text. They report a failure rather than seem to succeed.

namespace zvckmDravik {

std::string tServo::readServoConfigJson()
{
    zverr::raise(zvplaterr_softwareFaultPLATInternalUseOnly);
}

void tServo::writeServoConfigJson(const std::string& /*json*/)
{
    zverr::raise(zvplaterr_softwareFaultPLATInternalUseOnly);
}

void tServo::applyMetaData(const std::string& /*metaDataJson*/)
{
    zverr::raise(zvplaterr_softwareFaultPLATInternalUseOnly);
}

} // namespace zvckmDravik
