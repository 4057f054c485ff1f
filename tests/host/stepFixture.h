// What most tests of the host use.
#pragma once

#include "loop/tStep.h"
#include "servo/tServoLibrary.h"
#include "servo/tServoParameters.h"
#include "support/failureOf.h"
#include "text/files.h"
#include "text/quantity.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>
#include <string>
#include <unistd.h>

namespace dravikHost {

constexpr uint64_t kStartNs = 1'700'000'000'000'000'000;

constexpr int64_t nsOfSeconds(double seconds) { return static_cast<int64_t>(seconds * 1e9); }

inline tPair pairAt(double seconds, int64_t errorNs)
{
    const uint64_t referenceNs = kStartNs + static_cast<uint64_t>(nsOfSeconds(seconds));
    return {nsOfSeconds(seconds), referenceNs, referenceNs + static_cast<uint64_t>(errorNs), {}};
}

inline tStep stepAt(double seconds, int64_t errorNs, bool locked, double inForcePpb)
{
    tStep step;
    step.pair = pairAt(seconds, errorNs);
    step.locked = locked;
    step.inForcePpb = inForcePpb;
    return step;
}

// The plug-in beside the test program.
inline const tServoLibrary& library()
{
    static const tServoLibrary loaded(tServoLibrary::find(""));
    return loaded;
}

// Parameters of the law, the others as built in.
inline tServoParameters law(double g, double a, double b = 1, double c = 1)
{
    tServoParameters parameters;
    parameters.phaseLockGain = g;
    parameters.phaseLockCoefficientA = a;
    parameters.phaseLockCoefficientB = b;
    parameters.phaseLockCoefficientC = c;
    return parameters;
}

// A file that lives as long as the test; it is there once something writes it.
class tTestFile
{
public:
    explicit tTestFile(const std::string& name)
        : path(testing::TempDir() + "dravik-" + std::to_string(getpid()) + "-" + name)
    {}
    tTestFile(const std::string& name, const std::string& text) : tTestFile(name)
    {
        writeText(path, text);
    }
    tTestFile(const tTestFile&) = delete;
    tTestFile& operator=(const tTestFile&) = delete;
    ~tTestFile() { unlink(path.c_str()); }

    const std::string path;
};

} // namespace dravikHost
