#pragma once

#include "require.h"
#include "tExactStatus.h"
#include "zvckmservo/servo.h"

#include <cjson/cJSON.h>
#include <initializer_list>
#include <string>

// A servo on a clock that stands still.
class tFuzzHost
{
public:
    tFuzzHost()
    {
        table.getTime = [](uint64_t*, zverr_Status*) {};
        table.stepTime = [](int64_t, zverr_Status*) {};
        table.getFrequency = [](int32_t*, zverr_Status*) {};
        table.setFrequency = [](int32_t, zverr_Status*) {};
        table.getMaxFrequencyOffset = [](zverr_Status*) { return 500000; };
        table.getMinFrequencyOffset = [](zverr_Status*) { return -500000; };
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

    zvckmservo_HostTable table{};
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
