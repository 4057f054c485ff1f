#include "servo/tServoHost.h"

#include "servo/configDocument.h"

#include <fmt/format.h>

#include <cmath>
#include <exception>
#include <stdexcept>

namespace dravikHost {

namespace {

// Code of this host for a failure of its clock; the payload has the reason.
constexpr int32_t kClockFailed = -1;

// The clock of the call of the plug-in that this thread is in.
thread_local tServoHost::tSubject* current = nullptr;

class tCurrentScope
{
public:
    explicit tCurrentScope(tServoHost::tSubject& subject) : outer(current) { current = &subject; }
    tCurrentScope(const tCurrentScope&) = delete;
    tCurrentScope& operator=(const tCurrentScope&) = delete;
    ~tCurrentScope() { current = outer; }

private:
    tServoHost::tSubject* outer;
};

// Runs one operation and notes it. Nothing may be thrown through the plug-in: a failure of the
// clock becomes a failure in the status.
template <typename Action>
void perform(tHostOperation operation, zverr_Status* status, Action action) noexcept
{
    try {
        tHostCall call{operation};
        action(current->clock, call);
        current->calls.push_back(call);
    } catch (const std::exception& failure) {
        current->failure = std::current_exception();
        setFailure(status, kClockFailed, failure.what());
    } catch (...) {
        setFailure(status, kClockFailed, "unknown failure of the clock");
    }
}

void getTime(uint64_t* timeNs, zverr_Status* status)
{
    perform(kGetTime, status, [&](iClock& clock, tHostCall& call) {
        *timeNs = clock.timeNs();
        call.ns = static_cast<int64_t>(*timeNs);
    });
}

void stepTime(int64_t deltaNs, zverr_Status* status)
{
    perform(kStepTime, status, [&](iClock& clock, tHostCall& call) {
        clock.step(deltaNs);
        call.ns = deltaNs;
    });
}

void getFrequency(int32_t* offsetPpb, zverr_Status* status)
{
    perform(kGetFrequency, status, [&](iClock& clock, tHostCall& call) {
        call.ppb = *offsetPpb = static_cast<int32_t>(std::lround(clock.offsetPpb()));
    });
}

void setFrequency(int32_t offsetPpb, zverr_Status* status)
{
    perform(kSetFrequency, status, [&](iClock& clock, tHostCall& call) {
        clock.setOffsetPpb(offsetPpb);
        call.ppb = offsetPpb;
    });
}

int32_t getMaxFrequencyOffset(zverr_Status* status)
{
    int32_t limitPpb = 0;
    perform(kGetMaxFrequencyOffset, status,
            [&](iClock& clock, tHostCall& call) { call.ppb = limitPpb = clock.maxOffsetPpb(); });
    return limitPpb;
}

int32_t getMinFrequencyOffset(zverr_Status* status)
{
    int32_t limitPpb = 0;
    perform(kGetMinFrequencyOffset, status,
            [&](iClock& clock, tHostCall& call) { call.ppb = limitPpb = clock.minOffsetPpb(); });
    return limitPpb;
}

zvckmservo_HostTable newTable()
{
    zvckmservo_HostTable table{}; // no servo yet
    table.getTime = getTime;
    table.stepTime = stepTime;
    table.getFrequency = getFrequency;
    table.setFrequency = setFrequency;
    table.getMaxFrequencyOffset = getMaxFrequencyOffset;
    table.getMinFrequencyOffset = getMinFrequencyOffset;
    return table;
}

} // namespace

tServoHost::tServoHost(const tServoLibrary& library, iClock& clock)
    : library(library), subject{clock, {}, {}}, table(newTable())
{
    tStatus status;
    const tCurrentScope scope(subject);
    library.initialize(&table, &status);
    check(status, "initialize");
}

tServoHost::~tServoHost() { library.finalize(&table); }

// Nothing was thrown through the plug-in, but now it is: a person reads what the clock says, not
// how it was packed on its way.
void tServoHost::check(const tStatus& status, const char* what)
{
    if (status.code < 0 && subject.failure) std::rethrow_exception(subject.failure);
    status.check(what);
}

void tServoHost::adjustTime(uint64_t referenceNs, uint64_t clockNs)
{
    subject.calls.clear();
    subject.failure = nullptr;
    tStatus status;
    const tCurrentScope scope(subject);
    library.adjustTime(&table, referenceNs, clockNs, &status);
    check(status, "adjustTime");
}

void tServoHost::clearHistory()
{
    tStatus status;
    const tCurrentScope scope(subject);
    library.clearHistory(&table, &status);
    check(status, "clearHistory");
}

void tServoHost::writeConfig(const std::string& document)
{
    tStatus status;
    const tCurrentScope scope(subject);
    library.writeServoConfigJson(&table, document.c_str(), &status);
    if (status.code >= 0) return;
    throw std::runtime_error(
        fmt::format("refused with {}: {}", status.code, refusalText(document, status.details())));
}

// The plug-in tells no length and cuts without a word: a text that leaves some of its zeros in the
// buffer is whole.
std::string tServoHost::readConfig()
{
    const tCurrentScope scope(subject);
    for (size_t size = 1024;; size *= 2) {
        tStatus status;
        std::string text(size, '\0');
        library.readServoConfigJson(&table, text.data(), size, &status);
        status.check("readServoConfigJson");
        const size_t length = text.find('\0');
        if (length != std::string::npos) return text.substr(0, length);
    }
}

void tServoHost::applyMetaData(const std::string& metaData)
{
    tStatus status;
    const tCurrentScope scope(subject);
    library.applyMetaData(&table, metaData.c_str(), &status);
    status.check("applyMetaData");
}

} // namespace dravikHost
