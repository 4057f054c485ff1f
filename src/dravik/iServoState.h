#pragma once

#include "dravik/iServoConfig.h"
#include "dravik/iServoSMController.h"
#include "dravik/iTimekeeper.h"
#include "dravik/tTimeSpan.h"

namespace zvckmDravik {

// One state of the servo. It decides what a timestamp pair does to the clock; it reaches the servo
// through three interfaces only, knows no other state, and runs under the servo's lock.
//
//   from           pair                             to the clock             to
//   Idle           any                              nothing                  Idle
//   FrequencyLock  the first of a measurement       nothing                  FrequencyLock
//   FrequencyLock  offset within the limits         setFrequency(measured)   SnapTime
//   FrequencyLock  offset beyond, or not a number   setFrequency(clamped)    FrequencyLock
//   SnapTime       |error| >= threshold             stepTime                 PhaseLock
//   SnapTime       |error| <  threshold             nothing                  PhaseLock
//   PhaseLock      |error| >= threshold             nothing                  FrequencyLock
//   PhaseLock      |error| <  threshold             setFrequency(law)        PhaseLock
//
// Idle is left at the end of the servo's construction; clearHistory leads from anywhere to
// FrequencyLock. Nothing is rolled back when the clock fails: a state stays in force with what it
// remembers at that moment, and the next pair goes on from there.
class iServoState
{
public:
    iServoState(iTimekeeper& timekeeper, iServoSMController& controller, iServoConfig& config)
        : timekeeper(timekeeper), controller(controller), config(config)
    {}
    virtual ~iServoState() = default;
    iServoState(const iServoState&) = delete;
    iServoState& operator=(const iServoState&) = delete;

    virtual void enter() {}
    virtual void exit() {}
    virtual void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock) = 0;

protected:
    iTimekeeper& timekeeper;
    iServoSMController& controller;
    iServoConfig& config;
};

} // namespace zvckmDravik
