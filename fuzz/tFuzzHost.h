#pragma once

#include "require.h"
#include "support/hostParts.h"
#include "tExactStatus.h"

#include <cjson/cJSON.h>
#include <initializer_list>
#include <string>

// A servo on a clock that stands still.
class tFuzzHost
{
public:
    tFuzzHost()
    {
        tExactStatus status;
        zvckmservo_initialize(&table, &status);
    }
    tFuzzHost(const tFuzzHost&) = delete;
    tFuzzHost& operator=(const tFuzzHost&) = delete;
    ~tFuzzHost() { zvckmservo_finalize(&table); }

    // The document in force.
    std::string document()
    {
        std::string text(4096, '\0');
        tExactStatus status;
        REQUIRE(zvckmservo_readServoConfigJson(&table, text.data(), text.size(), &status) == 0);
        text.resize(text.find('\0'));
        return text;
    }

    zvckmservo_HostTable table =
        hostTable([](uint64_t*, zverr_Status*) {}, [](int64_t, zverr_Status*) {},
                  [](int32_t*, zverr_Status*) {}, [](int32_t, zverr_Status*) {},
                  [](zverr_Status*) { return 500000; }, [](zverr_Status*) { return -500000; });
};

// The end of a call: clean, or one of the documented codes with a payload that is valid JSON.
inline void requireOutcome(const tExactStatus& status, std::initializer_list<int32_t> codes)
{
    status.requireForm();
    if (status.code == 0) {
        REQUIRE(status.json == nullptr);
        return;
    }
    REQUIRE(std::find(codes.begin(), codes.end(), status.code) != codes.end());
    cJSON* const payload = cJSON_Parse(status.json);
    REQUIRE(cJSON_IsString(cJSON_GetObjectItem(payload, "error_constant")));
    cJSON_Delete(payload);
}
