#include "plainServo.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>

const tPlainBounds kPlainBounds[kParameters] = {
    {"frequencyLockGain", 1e-9, 10.0, 1.0},         {"phaseLockGain", 1e-9, 10.0, 0.55},
    {"phaseLockCoefficientA", -10.0, 10.0, 2.0},    {"phaseLockCoefficientB", -10.0, 10.0, 1.0},
    {"phaseLockCoefficientC", -10.0, 10.0, 1.0},    {"snapTimeThreshold", 1e-8, 10.0, 1e-6},
    {"spikeFilterEnabled", 0.0, 1.0, 0.0},          {"spikeFilterHistorySize", 2.0, 100.0, 5.0},
    {"spikeFilterMaxThreshold", 1e-9, 10.0, 1.0},   {"spikeFilterMinThreshold", 1e-9, 10.0, 2.5e-8},
    {"spikeFilterGrowthFactor", 1.001, 100.0, 3.0},
};

namespace {

constexpr int32_t kInvalidParameter = -52005;

uint64_t magnitudeOf(uint64_t difference)
{
    return difference >> 63U != 0 ? 0 - difference : difference;
}

// Of the difference of two timestamps, modulo 2^64.
double secondsOf(uint64_t difference)
{
    const double sign = difference >> 63U != 0 ? -1.0 : 1.0;
    return static_cast<double>(magnitudeOf(difference)) / 1e9 * sign;
}

// Of at most ten seconds; fractions are cut off.
uint64_t nanosecondsOf(double seconds)
{
    const double whole = std::floor(seconds);
    const double rest = (seconds - whole) * 1e9;
    return static_cast<uint64_t>(whole) * 1000000000 + static_cast<uint64_t>(rest);
}

// Toward zero, held at the limits of 32 bits; not a number gives 0.
int32_t cutToInt32(double value)
{
    if (std::isnan(value)) return 0;
    if (value >= 2147483647.0) return INT32_MAX;
    if (value <= -2147483648.0) return INT32_MIN;
    return static_cast<int32_t>(value);
}

int32_t getRatio(tPlainServo& s, double& ratio)
{
    int32_t ppb = 0;
    const int32_t code = s.host.getFrequency(ppb);
    ratio = 1.0 + static_cast<double>(ppb) * 1e-9;
    return code;
}

int32_t setRatio(tPlainServo& s, double ratio)
{
    s.host.noteRatio(ratio);
    const double ppb = (ratio - 1.0) * 1e9;
    return s.host.setFrequency(cutToInt32(ppb >= 0.0 ? ppb + 0.5 : ppb - 0.5));
}

double clamped(const tPlainServo& s, double offset)
{
    if (offset > s.maxOffset) return s.maxOffset;
    if (offset < s.minOffset) return s.minOffset;
    return offset;
}

// What a state forgets when it is left, and a measurement with it.
void enter(tPlainServo& s, tPlainState state)
{
    s.host.noteState(state);
    s.hasFirst = false;
    if (s.state == kPlainPhaseLock) {
        s.hasLast = false;
        s.lastError = 0.0;
        s.history.clear();
        s.historySum = 0.0;
        s.lastOffset = 0.0;
        s.threshold = s.parameter[kMaxThreshold];
    }
    s.state = state;
}

double filtered(tPlainServo& s, double offset, double elapsed)
{
    if (s.parameter[kFilterEnabled] == 0.0) return offset;
    if (elapsed <= 0.0) return s.lastOffset = offset;
    const double rate = (offset - s.lastOffset) / elapsed;
    double magnitude = std::fabs(rate);
    if (magnitude > s.threshold) {
        const double limited = s.threshold * (rate < 0.0 ? -1.0 : 1.0);
        offset = s.lastOffset + limited * elapsed;
        magnitude = std::fabs(limited);
    }
    s.lastOffset = offset;
    while (s.parameter[kHistorySize] <= static_cast<double>(s.history.size())) {
        s.historySum -= s.history.front();
        s.history.erase(s.history.begin());
    }
    s.historySum += magnitude;
    s.history.push_back(magnitude);
    const double mean = s.historySum / static_cast<double>(s.history.size());
    const double candidate = s.parameter[kGrowthFactor] * mean;
    s.threshold = candidate;
    if (candidate > s.parameter[kMaxThreshold]) {
        s.threshold = s.parameter[kMaxThreshold];
    } else if (candidate < s.parameter[kMinThreshold]) {
        s.threshold = s.parameter[kMinThreshold];
    }
    return offset;
}

// May divide by zero, and goes on with what comes of it.
__attribute__((no_sanitize("float-divide-by-zero"))) int32_t
frequencyLock(tPlainServo& s, uint64_t reference, uint64_t clock)
{
    if (!s.hasFirst) {
        s.hasFirst = true;
        s.firstReference = reference;
        s.firstClock = clock;
        return 0;
    }
    const double rate = secondsOf(reference - s.firstReference) / secondsOf(clock - s.firstClock);
    double current = 0.0;
    int32_t code = getRatio(s, current);
    if (code < 0) return code;
    const double ratio = current * (rate * s.parameter[kFrequencyLockGain]);
    const double offset = ratio - 1.0;
    if (offset <= s.maxOffset && offset >= s.minOffset) {
        code = setRatio(s, ratio);
        if (code >= 0) enter(s, kPlainSnapTime);
        return code;
    }
    s.hasFirst = false;
    return setRatio(s, clamped(s, offset) + 1.0);
}

int32_t snapTime(tPlainServo& s, uint64_t reference, uint64_t clock)
{
    const uint64_t delta = reference - clock;
    int32_t code = 0;
    if (magnitudeOf(delta) >= nanosecondsOf(s.parameter[kSnapTimeThreshold])) {
        code = s.host.stepTime(static_cast<int64_t>(delta));
    }
    if (code >= 0) enter(s, kPlainPhaseLock);
    return code;
}

int32_t phaseLock(tPlainServo& s, uint64_t reference, uint64_t clock)
{
    const double phaseError = secondsOf(clock - reference);
    if (s.parameter[kSnapTimeThreshold] <= std::fabs(phaseError)) {
        enter(s, kPlainFrequencyLock);
        return 0;
    }
    const double elapsed = s.hasLast ? secondsOf(reference - s.lastReference) : 0.0;
    s.lastReference = reference;
    s.hasLast = true;
    const double e = -filtered(s, phaseError, elapsed);
    double current = 0.0;
    int32_t code = getRatio(s, current);
    if (code < 0) return code;
    const double g = s.parameter[kPhaseLockGain];
    const double p = (g * s.parameter[kCoefficientB]) * s.lastError;
    const double q = (g * s.parameter[kCoefficientA]) * e - p;
    const double u = q + (current - 1.0) * s.parameter[kCoefficientC];
    code = setRatio(s, clamped(s, u) + 1.0);
    if (code >= 0) s.lastError = e;
    return code;
}

} // namespace

tPlainServo::tPlainServo(tScriptedHost& clock) : host(clock), parameter()
{
    for (int i = 0; i < kParameters; ++i)
        parameter[i] = kPlainBounds[i].initial;
}

int32_t plainInitialize(tPlainServo& s)
{
    int32_t ppb = 0;
    int32_t code = s.host.getMaxFrequencyOffset(ppb);
    if (code < 0) return code;
    s.maxOffset = static_cast<double>(ppb) * 1e-9;
    code = s.host.getMinFrequencyOffset(ppb);
    s.minOffset = static_cast<double>(ppb) * 1e-9;
    return code;
}

int32_t plainClearHistory(tPlainServo& s)
{
    enter(s, kPlainFrequencyLock);
    return 0;
}

int32_t plainAdjustTime(tPlainServo& s, uint64_t reference, uint64_t clock)
{
    if (s.state == kPlainFrequencyLock) return frequencyLock(s, reference, clock);
    if (s.state == kPlainSnapTime) return snapTime(s, reference, clock);
    return phaseLock(s, reference, clock);
}

int32_t plainGetTime(tPlainServo& s, uint64_t& time) { return s.host.getTime(time); }

int32_t plainWrite(tPlainServo& s, const std::vector<tPlainMember>& document)
{
    for (int i = 0; i < kParameters; ++i) {
        for (const tPlainMember& member : document) {
            if (member.parameter != i) continue;
            if (!member.isNumber) return kInvalidParameter;
            double value = member.number;
            if (i == kFilterEnabled) value = cutToInt32(value) == 1 ? 1.0 : 0.0;
            if (i == kHistorySize) value = cutToInt32(value);
            const bool fits = value >= kPlainBounds[i].lowest && value <= kPlainBounds[i].highest;
            if (!fits) return kInvalidParameter;
            s.parameter[i] = value;
            break; // the first of a key counts
        }
    }
    return 0;
}

std::string plainRead(const tPlainServo& s)
{
    std::string text = "{\n";
    for (int i = 0; i < kParameters; ++i) {
        char number[32];
        (void)std::snprintf(number, sizeof number, "%1.15g", s.parameter[i]);
        if (std::strtod(number, nullptr) != s.parameter[i]) {
            (void)std::snprintf(number, sizeof number, "%1.17g", s.parameter[i]);
        }
        text += std::string("\t\"") + kPlainBounds[i].key + "\":\t" + number;
        text += i + 1 < kParameters ? ",\n" : "\n";
    }
    return text + "}";
}

int32_t plainApplyType(tPlainServo& s, const std::string& type)
{
    if (type == s.referenceType) return 0;
    s.referenceType = type;
    if (type == "IEEE 802.1AS-2011 TAB") s.log += ", dravik_tr_ptp4l_tab.json";
    if (type == "IEEE 1588-2008 BC") s.log += ", dravik_tr_ptp4l_bc.json";
    return 0;
}
