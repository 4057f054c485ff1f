#include "support/tHostStatus.h"

#include "support/hostParts.h"

#include <cstddef>
#include <cstring>
#include <gtest/gtest.h>
#include <stdexcept>

namespace {

tHostStatus& ownerOf(zverr_Status* status)
{
    static_assert(offsetof(tHostStatus, record) == 0, "the record is found from its address");
    return *reinterpret_cast<tHostStatus*>(status);
}

} // namespace

extern "C" bool foreignReallocJson(zverr_Status* status, uint32_t size)
{
    tHostStatus& owner = ownerOf(status);
    owner.requests.push_back(size);
    if (owner.mode == tHostStatus::kThrow) throw std::runtime_error("reallocJson of the host");
    if (size > 0 && (owner.mode == tHostStatus::kRefuse || size > owner.largest)) return false;
    if (size > 0 && owner.mode == tHostStatus::kGrantNothing) return true;
    return exactReallocJson(status, size);
}

tHostStatus::tHostStatus(int32_t code, const char* text)
    : record{code, 0, foreignReallocJson, nullptr}
{
    if (text == nullptr) return;
    const std::string content = text;
    foreignReallocJson(&record, static_cast<uint32_t>(content.size() + 2));
    content.copy(record.json, content.size());
    requests.clear();
}

tHostStatus::~tHostStatus()
{
    expectBufferForm(record);
    exactReallocJson(&record, 0);
}

void tHostStatus::reset()
{
    exactReallocJson(&record, 0);
    record = {0, 0, foreignReallocJson, nullptr};
    requests.clear();
}

std::string tHostStatus::text() const { return record.json != nullptr ? record.json : "(none)"; }

void expectBufferForm(const zverr_Status& status)
{
    if (status.json == nullptr) {
        EXPECT_EQ(0U, status.capacity);
        return;
    }
    const size_t length = strnlen(status.json, status.capacity);
    ASSERT_LE(length + 2, status.capacity);
    for (size_t i = length; i < status.capacity - 1U; ++i) {
        ASSERT_EQ(0, status.json[i]) << "byte " << i;
    }
    EXPECT_EQ('J', status.json[status.capacity - 1]);
}
