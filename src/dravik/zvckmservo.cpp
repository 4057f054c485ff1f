#include "zvckmservo/servo.h"

#include "dravik/tServo.h"
#include "zverr/tools/exception_errStatus.h"
#include "zvplat/quarks/cancellation.h"

#include <stdexcept>

// The boundary. Each function checks the status that came in, holds thread cancellation off, calls
// one operation of the servo and turns whatever is thrown into the status; nothing else happens
// here.

using zvckmDravik::tServo;
using zvckmDravik::tTimeSpan;

namespace {

tServo& servoOf(const zvckmservo_HostTable* host)
{
    return *static_cast<tServo*>(host->servoHandle);
}

} // namespace

void zvckmservo_initialize(zvckmservo_HostTable* host, zverr_Status* status)
{
    if (status->code < 0) return;
    const tCancellationPause pause;
    try {
        tServo* const servo = new tServo(host);
        host->servoHandle = servo; // only once there is one
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
}

void zvckmservo_finalize(zvckmservo_HostTable* host) noexcept
{
    const tServo* const servo = static_cast<tServo*>(host->servoHandle);
    host->servoHandle = nullptr;
    delete servo;
}

int32_t zvckmservo_isSeeded(zvckmservo_HostTable* /*host*/) { return 0; }

void zvckmservo_clearHistory(zvckmservo_HostTable* host, zverr_Status* status)
{
    if (status->code < 0) return;
    const tCancellationPause pause;
    try {
        servoOf(host).clearHistory();
    } catch (...) { // unreached: no state raises when it is left or entered, but they may come to
        zverr_exceptionToStatus(status);
    }
}

void zvckmservo_adjustTime(zvckmservo_HostTable* host, uint64_t referenceTime, uint64_t clockTime,
                           zverr_Status* status)
{
    if (status->code < 0) return;
    const tCancellationPause pause;
    try {
        servoOf(host).adjustTime(tTimeSpan(referenceTime), tTimeSpan(clockTime));
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
}

void zvckmservo_getTime(zvckmservo_HostTable* host, uint64_t* time, zverr_Status* status)
{
    if (status->code < 0) return;
    const tCancellationPause pause;
    try {
        *time = servoOf(host).getTime().getMagnitude();
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
}

int zvckmservo_writeServoConfigJson(zvckmservo_HostTable* host, const char* configJson,
                                    zverr_Status* status)
{
    if (status->code < 0) return 1;
    const tCancellationPause pause;
    try {
        if (configJson == nullptr) throw std::logic_error("no configuration text");
        servoOf(host).writeServoConfigJson(configJson);
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
    return status->code < 0 ? 1 : 0;
}

int zvckmservo_readServoConfigJson(zvckmservo_HostTable* host, char* buffer, size_t bufferSize,
                                   zverr_Status* status)
{
    if (status->code < 0) return 1;
    const tCancellationPause pause;
    try {
        servoOf(host).readServoConfigJson().copy(buffer, bufferSize);
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
    return status->code < 0 ? 1 : 0;
}

void zvckmservo_applyMetaData(zvckmservo_HostTable* host, const char* metaDataJson,
                              zverr_Status* status)
{
    if (status->code < 0 || metaDataJson == nullptr) return;
    const tCancellationPause pause;
    try {
        servoOf(host).applyMetaData(metaDataJson);
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
}
