#pragma once

#include "dravik/tServo.h"

// A servo whose three inner interfaces a test may use.
struct tOpenServo : zvckmDravik::tServo {
    using tServo::tServo;
    zvckmDravik::iServoConfig& config() { return *this; }
    zvckmDravik::iServoSMController& controller() { return *this; }
    zvckmDravik::iTimekeeper& timekeeper() { return *this; }
};
