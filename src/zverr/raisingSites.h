#pragma once

#include "zvckmservo/parameters.h"
#include "zverr/status.h"

// Every place of the plug-in that raises a failure and says so in the payload, with the code.
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

namespace zverr {

// unreached: the compiler runs these functions.

// The component of every failure that the plug-in raises.
constexpr const char* kComponent = "dravik";

constexpr zverr_RaisingSite memoryFullAt(const char* file, uint32_t line)
{
    return {zvplaterr_memoryFull, "zvplaterr_memoryFull", {file, line, kComponent}};
}

constexpr zverr_RaisingSite softwareFaultAt(const char* file, uint32_t line)
{
    return {zvplaterr_softwareFaultPLATInternalUseOnly,
            "zvplaterr_softwareFaultPLATInternalUseOnly",
            {file, line, kComponent}};
}

constexpr zverr_RaisingSite invalidParameterAt(const char* file, uint32_t line)
{
    return {zvplaterr_invalidParameter, "zvplaterr_invalidParameter", {file, line, kComponent}};
}

constexpr zverr_RaisingSite resourceNotFoundAt(const char* file, uint32_t line)
{
    return {zvplaterr_resourceNotFound, "zvplaterr_resourceNotFound", {file, line, kComponent}};
}

// The bridge, by the exception that it met.
constexpr const char* kBridgeFile = "zverr/tools/exception_errStatus";
constexpr auto kAtBadAlloc = memoryFullAt(kBridgeFile, 62);
constexpr auto kAtStandardException = softwareFaultAt(kBridgeFile, 69);
constexpr auto kAtUnknownException = softwareFaultAt(kBridgeFile, 74);

// The platform layer, which reports in a record of its own.
constexpr zverr_RaisingSite kAtNewArray = {
    zvplaterr_memoryFull,
    nullptr,
    {"zvplat/protons/cppNewDelete/memoryAllocation", 346, kComponent}};
constexpr zverr_RaisingSite kAtMutexCreation = {zvplaterr_softwareFaultPLATInternalUseOnly,
                                                nullptr,
                                                {"zvplat/quarks/synchronization", 655, kComponent}};

// The containers.
constexpr auto kAtAllocator = memoryFullAt("zvktl/err/Allocator", 32);

// The dynamic loader.
constexpr auto kAtLoad = invalidParameterAt("zvdynlib/dynload", 110);
constexpr auto kAtSymbol = invalidParameterAt("zvdynlib/dynload", 185);

// The reader of whole files.
constexpr const char* kStdpathUtilFile = "zvhostq/stdpath_util";
constexpr auto kAtOpenFile = resourceNotFoundAt(kStdpathUtilFile, 224);
constexpr zverr_RaisingSite kAtReadFile = {
    zvplaterr_osFault, "zvplaterr_osFault", {kStdpathUtilFile, 249, kComponent}};

// The accessor of the configuration document.
constexpr const char* kJsonConfigFile = "dravik/tJsonConfig";
constexpr auto kAtNewDocument = memoryFullAt(kJsonConfigFile, 16);
constexpr auto kAtParseDocument = invalidParameterAt(kJsonConfigFile, 29);
constexpr auto kAtNoInteger = resourceNotFoundAt(kJsonConfigFile, 56);
constexpr auto kAtBadInteger = invalidParameterAt(kJsonConfigFile, 61);
constexpr auto kAtNoDouble = resourceNotFoundAt(kJsonConfigFile, 81);
constexpr auto kAtBadDouble = invalidParameterAt(kJsonConfigFile, 86);
constexpr auto kAtSetInteger = invalidParameterAt(kJsonConfigFile, 110);
constexpr auto kAtSetDouble = invalidParameterAt(kJsonConfigFile, 145);

// The helpers for JSON documents. The last one's constant is these very letters.
constexpr zverr_RaisingSite kAtCppJson = {
    jsonErrorsInvalidJSON, "jsonErrorsInvalidJSON", {"zvjsonkit/CppJson", 34, kComponent}};
constexpr zverr_RaisingSite kAtAssertObject = {
    jsonErrorsNotAnObject, "jsonErrorsNotAnObject", {"zvjsonkit/cJSONUtils", 78, kComponent}};
constexpr zverr_RaisingSite kAtAssertString = {
    jsonErrorsTypeMismatch, "jsonErrorsTypeMismatch", {"zvjsonkit/cJSONUtils", 305, kComponent}};
constexpr zverr_RaisingSite kAtGetOptionalString = {
    jsonErrorsTypeMismatch, "errCode", {"zvsynctools_cjson/jsonHelperFunctions", 50, kComponent}};

// The setters of the tuning parameters.
constexpr auto outOfBounds(zvckmservo_ParameterIndex index)
{
    return invalidParameterAt("dravik/tServo", zvckmservo_parameters[index].line);
}
constexpr auto kAtFrequencyLockGain = outOfBounds(zvckmservo_kFrequencyLockGain);
constexpr auto kAtPhaseLockGain = outOfBounds(zvckmservo_kPhaseLockGain);
constexpr auto kAtPhaseLockCoefficientA = outOfBounds(zvckmservo_kPhaseLockCoefficientA);
constexpr auto kAtPhaseLockCoefficientB = outOfBounds(zvckmservo_kPhaseLockCoefficientB);
constexpr auto kAtPhaseLockCoefficientC = outOfBounds(zvckmservo_kPhaseLockCoefficientC);
constexpr auto kAtSnapTimeThreshold = outOfBounds(zvckmservo_kSnapTimeThreshold);
constexpr auto kAtSpikeFilterHistorySize = outOfBounds(zvckmservo_kSpikeFilterHistorySize);
constexpr auto kAtSpikeFilterMaxThreshold = outOfBounds(zvckmservo_kSpikeFilterMaxThreshold);
constexpr auto kAtSpikeFilterMinThreshold = outOfBounds(zvckmservo_kSpikeFilterMinThreshold);
constexpr auto kAtSpikeFilterGrowthFactor = outOfBounds(zvckmservo_kSpikeFilterGrowthFactor);

} // namespace zverr
