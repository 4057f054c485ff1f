// Any sequence of additions to a payload, in a buffer that grows as little as asked and only so
// far. What was written parses at every step and reads back the same.

#include "require.h"
#include "tExactStatus.h"
#include "zverr/jsonzLookup.h"
#include "zverr/jsonzString.h"
#include "zverr/payload.h"

#include <algorithm>
#include <cstring>
#include <fuzzer/FuzzedDataProvider.h>
#include <string>
#include <vector>

namespace {

struct tMember {
    std::string key;
    bool isString;
    std::string text;
    int32_t number;
    bool inObject; // the members of one object stand side by side
};

constexpr const char* kObjectKey = "o";

void readBack(const tExactStatus& status, const std::vector<tMember>& members)
{
    const char* const last = status.json + std::strlen(status.json) - 1;
    REQUIRE(jsonz_closingBracket(status.json) == last);
    status.requireForm();
    const char* const object = jsonz_findMember(status.json, kObjectKey);
    for (auto at = members.begin(); at != members.end(); ++at) {
        const tMember& member = *at;
        const bool hidden = std::any_of(members.begin(), at, [&](auto& earlier) {
            return earlier.key == member.key && earlier.inObject == member.inObject;
        });
        if (hidden) continue; // the first of a name is found
        const char* const value =
            jsonz_findMember(member.inObject ? object : status.json, member.key.c_str());
        uint32_t length = 0;
        const char* const string = jsonz_getString(value, nullptr, &length, nullptr);
        REQUIRE((string != nullptr) == member.isString);
        if (member.isString) {
            REQUIRE(jsonz_equalsEscaped(member.text.c_str(), string, length));
        } else {
            REQUIRE(jsonz_getInt(value, ~member.number, nullptr) == member.number);
        }
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    tExactStatus status(input.ConsumeIntegralInRange<uint32_t>(4, 4096));
    const jsonz_Grower grower = {[](char* position, void* context) {
                                     return zverr_growJson(position,
                                                           static_cast<zverr_Status*>(context));
                                 },
                                 &status};
    const auto text = [&] {
        std::string bytes = input.ConsumeRandomLengthString(64);
        bytes.resize(std::strlen(bytes.c_str()));
        return bytes;
    };

    std::vector<tMember> members;
    bool inObject = false;
    bool objectDone = false;
    char* position = zverr_reserveJson(&status, 2);
    while (position != nullptr && input.remaining_bytes() > 0) {
        tMember member = {"k" + text(), false, "", 0, inObject};
        const char* const key = member.key.c_str();
        switch (input.ConsumeIntegralInRange(0, 4)) {
        case 0:
            member.isString = true;
            member.text = text();
            position = jsonz_addString(position, key, member.text, &grower);
            break;
        case 1:
            member.number = input.ConsumeIntegral<int32_t>();
            position = jsonz_addInt(position, key, member.number, &grower);
            break;
        case 2: {
            const auto number = input.ConsumeIntegral<uint32_t>();
            member.number = static_cast<int32_t>(std::min<uint32_t>(number, INT32_MAX));
            position = jsonz_addUInt(position, key, number, &grower);
            break;
        }
        case 3: // one object is enough to read back
            if (objectDone) continue;
            position = jsonz_addObject(position, kObjectKey, &grower);
            inObject = objectDone = position != nullptr;
            continue;
        default:
            if (inObject) position = jsonz_endObject(position);
            inObject = false;
            continue;
        }
        if (position != nullptr) members.push_back(member);
        readBack(status, members);
    }
    if (status.json != nullptr) readBack(status, members);
    return 0;
}
