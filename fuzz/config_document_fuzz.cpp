// Any bytes as a configuration document. It is applied or refused with a documented code, and the
// document then in force reads back as itself.

#include "tFuzzHost.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    tFuzzHost host;
    tExactStatus status;
    const int result = zvckmservo_writeServoConfigJson(&host.table, text.c_str(), &status);
    requireOutcome(status, {zvplaterr_invalidParameter});
    REQUIRE(result == (status.code < 0 ? 1 : 0));

    const std::string inForce = host.document();
    tFuzzHost other;
    tExactStatus clean;
    REQUIRE(zvckmservo_writeServoConfigJson(&other.table, inForce.c_str(), &clean) == 0);
    REQUIRE(other.document() == inForce);
    return 0;
}
