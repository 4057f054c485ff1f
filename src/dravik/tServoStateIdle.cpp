#include "dravik/tServoStateIdle.h"

namespace zvckmDravik {

void tServoStateIdle::enter() {}

void tServoStateIdle::exit() {}

void tServoStateIdle::adjustTime(const tTimeSpan& /*reference*/, const tTimeSpan& /*clock*/) {}

} // namespace zvckmDravik
