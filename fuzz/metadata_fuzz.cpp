// Any bytes as metadata. It is taken or refused with a documented code, and the tuning stays, as no
// default file is there.

#include "tFuzzHost.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    static tFuzzHost host;
    static const std::string inForce = host.document();
    tExactStatus status;
    zvckmservo_applyMetaData(&host.table, text.c_str(), &status);
    requireOutcome(status, {jsonErrorsTypeMismatch, jsonErrorsInvalidJSON});
    REQUIRE(host.document() == inForce);
    return 0;
}
