#pragma once

#include "zverr/status.h"

// Every place of the plug-in that raises a failure, with its code and what the payload says of it.
// Hosts read these names and numbers, so a line stays when the code around it moves.

struct zverr_SourcePosition {
    const char* file; // source unit, without its ending
    uint32_t line;
    const char* component; // null: not told
};

struct zverr_RaisingSite {
    int32_t code;
    const char* constant; // the code's name; null: not told
    zverr_SourcePosition position;
};

// The component of every failure that the plug-in raises.
constexpr const char* kZverrComponent = "dravik";

constexpr zverr_RaisingSite zverr_memoryFullAt(const char* file, uint32_t line)
{
    return {zvplaterr_memoryFull, "zvplaterr_memoryFull", {file, line, kZverrComponent}};
}

constexpr zverr_RaisingSite zverr_softwareFaultAt(const char* file, uint32_t line)
{
    return {zvplaterr_softwareFaultPLATInternalUseOnly,
            "zvplaterr_softwareFaultPLATInternalUseOnly",
            {file, line, kZverrComponent}};
}

constexpr zverr_RaisingSite zverr_invalidParameterAt(const char* file, uint32_t line)
{
    return {
        zvplaterr_invalidParameter, "zvplaterr_invalidParameter", {file, line, kZverrComponent}};
}

// The bridge, by the exception that it met.
constexpr const char* kBridgeFile = "zverr/tools/exception_errStatus";
constexpr auto kAtBadAlloc = zverr_memoryFullAt(kBridgeFile, 62);
constexpr auto kAtStandardException = zverr_softwareFaultAt(kBridgeFile, 69);
constexpr auto kAtUnknownException = zverr_softwareFaultAt(kBridgeFile, 74);

// The platform layer, which reports in a record of its own.
constexpr zverr_RaisingSite kAtNewArray = {
    zvplaterr_memoryFull,
    nullptr,
    {"zvplat/protons/cppNewDelete/memoryAllocation", 346, kZverrComponent}};
constexpr zverr_RaisingSite kAtMutexCreation = {
    zvplaterr_softwareFaultPLATInternalUseOnly,
    nullptr,
    {"zvplat/quarks/synchronization", 655, kZverrComponent}};

// The containers.
constexpr auto kAtAllocator = zverr_memoryFullAt("zvktl/err/Allocator", 32);

// The dynamic loader.
constexpr auto kAtLoad = zverr_invalidParameterAt("zvdynlib/dynload", 110);
constexpr auto kAtSymbol = zverr_invalidParameterAt("zvdynlib/dynload", 185);

// The setters of the tuning parameters.
constexpr const char* kServoFile = "dravik/tServo";
constexpr auto kAtFrequencyLockGain = zverr_invalidParameterAt(kServoFile, 77);
constexpr auto kAtPhaseLockGain = zverr_invalidParameterAt(kServoFile, 98);
constexpr auto kAtPhaseLockCoefficientA = zverr_invalidParameterAt(kServoFile, 119);
constexpr auto kAtPhaseLockCoefficientB = zverr_invalidParameterAt(kServoFile, 140);
constexpr auto kAtPhaseLockCoefficientC = zverr_invalidParameterAt(kServoFile, 161);
constexpr auto kAtSnapTimeThreshold = zverr_invalidParameterAt(kServoFile, 182);
constexpr auto kAtSpikeFilterHistorySize = zverr_invalidParameterAt(kServoFile, 235);
constexpr auto kAtSpikeFilterMaxThreshold = zverr_invalidParameterAt(kServoFile, 256);
constexpr auto kAtSpikeFilterMinThreshold = zverr_invalidParameterAt(kServoFile, 277);
constexpr auto kAtSpikeFilterGrowthFactor = zverr_invalidParameterAt(kServoFile, 298);
