#include "dravik/tServo.h"

#include <stdexcept>

// The three operations on JSON text. They report a failure rather than seem to succeed.

namespace zvckmDravik {

std::string tServo::readServoConfigJson()
{
    throw std::logic_error("no JSON text is taken or given yet");
}

void tServo::writeServoConfigJson(const std::string& /*json*/)
{
    throw std::logic_error("no JSON text is taken or given yet");
}

void tServo::applyMetaData(const std::string& /*metaDataJson*/)
{
    throw std::logic_error("no JSON text is taken or given yet");
}

} // namespace zvckmDravik
