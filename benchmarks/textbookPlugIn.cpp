// The textbook controller as a plug-in, so that dravik-host runs it where it runs the real one.
// It takes the clock over as that one does: two pairs for the frequency, one for a step, and from
// the fourth pair on the controller. The interval is that of the first two pairs. It reports no
// failure of its own and never gives a lock up. Between pairs it keeps its frequency itself, so it
// is run at a resolution of 1 ppb.

#include "textbookController.h"
#include "zvckmservo/parameters.h"

#include <cmath>
#include <string>

namespace {

class tTextbookServo
{
public:
    void adjustTime(zvckmservo_HostTable* host, uint64_t reference, uint64_t clock,
                    zverr_Status* status)
    {
        switch (pairs++) {
        case 0:
            firstReference = reference;
            firstClock = clock;
            break;
        case 1:
            measureFrequency(host, reference, clock, status);
            break;
        case 2:
            host->stepTime(static_cast<int64_t>(reference - clock), status);
            break;
        default:
            controller.adjustTime(host, reference, clock, status);
        }
    }

private:
    void measureFrequency(zvckmservo_HostTable* host, uint64_t reference, uint64_t clock,
                          zverr_Status* status)
    {
        const double referenceNs = static_cast<double>(reference - firstReference);
        const double clockNs = static_cast<double>(clock - firstClock);
        int32_t presentPpb = 0;
        host->getFrequency(&presentPpb, status);
        const double ratio = (1.0 + presentPpb * 1e-9) * (referenceNs / clockNs);
        const auto offsetPpb = static_cast<int32_t>(std::lround((ratio - 1.0) * 1e9));
        host->setFrequency(offsetPpb, status);
        controller = tTextbookController(referenceNs * 1e-9, offsetPpb);
    }

    uint64_t pairs = 0;
    uint64_t firstReference = 0;
    uint64_t firstClock = 0;
    tTextbookController controller;
};

tTextbookServo& servoOf(const zvckmservo_HostTable* host)
{
    return *static_cast<tTextbookServo*>(host->servoHandle);
}

} // namespace

void zvckmservo_initialize(zvckmservo_HostTable* host, zverr_Status* /*status*/)
{
    host->servoHandle = new tTextbookServo;
}

void zvckmservo_finalize(zvckmservo_HostTable* host) noexcept
{
    delete static_cast<tTextbookServo*>(host->servoHandle);
    host->servoHandle = nullptr;
}

int32_t zvckmservo_isSeeded(zvckmservo_HostTable* /*host*/) { return 0; }

void zvckmservo_clearHistory(zvckmservo_HostTable* host, zverr_Status* /*status*/)
{
    servoOf(host) = tTextbookServo();
}

void zvckmservo_adjustTime(zvckmservo_HostTable* host, uint64_t referenceTime, uint64_t clockTime,
                           zverr_Status* status)
{
    servoOf(host).adjustTime(host, referenceTime, clockTime, status);
}

void zvckmservo_getTime(zvckmservo_HostTable* host, uint64_t* time, zverr_Status* status)
{
    host->getTime(time, status);
}

// It has none of the parameters: it gives out those of a new servo, and takes any.
int zvckmservo_writeServoConfigJson(zvckmservo_HostTable* /*host*/, const char* /*configJson*/,
                                    zverr_Status* /*status*/)
{
    return 0;
}

int zvckmservo_readServoConfigJson(zvckmservo_HostTable* /*host*/, char* buffer, size_t bufferSize,
                                   zverr_Status* /*status*/)
{
    std::string text = "{";
    for (const zvckmservo_Parameter& parameter : zvckmservo_parameters) {
        text += text.size() > 1 ? ", \"" : "\"";
        text += std::string(parameter.key) + "\": " + parameter.initialText;
    }
    text += '}';
    buffer[text.copy(buffer, bufferSize - 1)] = '\0';
    return 0;
}

void zvckmservo_applyMetaData(zvckmservo_HostTable* /*host*/, const char* /*metaDataJson*/,
                              zverr_Status* status)
{
    status->code = zvplaterr_softwareFaultPLATInternalUseOnly;
}
