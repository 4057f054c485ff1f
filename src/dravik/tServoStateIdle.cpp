#include "dravik/tServoStateIdle.h"

namespace zvckmDravik {

void tServoStateIdle::adjustTime(const tTimeSpan& /*reference*/, const tTimeSpan& /*clock*/) {}

} // namespace zvckmDravik
