#include "zverr/errStatus.h"

#include "zverr/jsonz.h"

#include <cstdlib>
#include <cstring>

namespace {

const char* const kEmptyObject = "{}";
constexpr uint32_t kSmallestBuffer = 512;
constexpr uint32_t kTopBit = 0x80000000U;
constexpr size_t kLongestText = 0x7FFFFFFDU;

// The smallest power of two, 512 or more, that is not below `size`; the top bit of `size` is clear.
constexpr uint32_t bufferSizeFor(uint32_t size)
{
    uint32_t result = kSmallestBuffer;
    while (result < size) {
        result *= 2;
    }
    return result;
}
static_assert(bufferSizeFor(1) == 512 && bufferSizeFor(512) == 512 && bufferSizeFor(513) == 1024 &&
                  bufferSizeFor(1025) == 2048 && bufferSizeFor(kTopBit - 1) == kTopBit,
              "powers of two from 512 on");

} // namespace

bool zverr_defaultReallocJson(zverr_Status* status, uint32_t size)
{
    if (size == 0) {
        std::free(status->json);
        status->capacity = 0;
        status->json = nullptr;
        return true;
    }
    if (size <= status->capacity) return true;
    if (size >= kTopBit) return false;

    const uint32_t newSize = bufferSizeFor(size);
    char* const buffer = static_cast<char*>(std::malloc(newSize));
    if (buffer == nullptr) return false;
    jsonz_formatBuffer(buffer, newSize, status->json != nullptr ? status->json : kEmptyObject);
    std::free(status->json);
    status->capacity = newSize;
    status->json = buffer;
    return true;
}

bool zverr_ensureCapacity(zverr_Status* status, uint32_t size)
{
    if (status->capacity < size && !status->reallocJson(status, size)) return false;
    return status->json != nullptr && status->capacity >= size;
}

bool zverr_setJson(zverr_Status* status, const char* text)
{
    if (text == nullptr) text = kEmptyObject;
    const size_t length = std::strlen(text);
    if (length > kLongestText) return false; // unreached: a test would need 2 GB
    const uint32_t need = static_cast<uint32_t>(length) + kJsonzOverhead;
    if (!zverr_ensureCapacity(status, need)) return false;
    jsonz_formatBuffer(status->json, status->capacity, text);
    return true;
}

bool zverr_codeReplaces(int32_t newCode, int32_t code)
{
    return code == 0 ? newCode != 0 : code > 0 && newCode < 0;
}

bool zverr_setCode(zverr_Status* status, int32_t code)
{
    if (!zverr_codeReplaces(code, status->code)) return false;
    status->code = code;
    if (status->json != nullptr) {
        (void)zverr_setJson(status, nullptr);
    }
    return true;
}

bool zverr_takeStatus(zverr_Status* target, zverr_Status* source)
{
    if (!zverr_setCode(target, source->code)) return false;
    if (target->reallocJson != source->reallocJson) {
        (void)zverr_setJson(target, source->json);
        return true;
    }
    target->reallocJson(target, 0);
    target->capacity = source->capacity;
    target->json = source->json;
    if (source->json != nullptr) {
        source->capacity = 0;
        source->json = nullptr;
    }
    return true;
}

bool zverr_copyStatus(zverr_Status* target, const zverr_Status* source)
{
    if (!zverr_setCode(target, source->code)) return false;
    if (source->json != nullptr) {
        (void)zverr_setJson(target, source->json);
    }
    return true;
}

void zverr_releaseJson(zverr_Status* status) noexcept
{
    if (status->json == nullptr) return;
    try {
        status->reallocJson(status, 0);
    } catch (...) { // NOLINT(bugprone-empty-catch): the record ends here, nobody is left to tell
    }
}
