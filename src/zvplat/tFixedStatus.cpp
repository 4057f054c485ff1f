#include "zvplat/tFixedStatus.h"

#include "zverr/errStatus.h"
#include "zverr/payload.h"

#include <algorithm>
#include <cstring>

namespace {

// Asked for before each group of members, which take what they get: nothing grows for them.
constexpr uint32_t kRoom = 256;

// Copies what fits and fills up with zero bytes, one at least.
template <size_t Size> void copyText(char (&out)[Size], const char* text)
{
    const size_t length = std::min(std::strlen(text), Size - 1);
    std::memcpy(out, text, length);
    std::memset(out + length, 0, Size - length);
}

// Copies a text that is too long: the first half, two dots, the end.
template <size_t Size> void copyBothEnds(char (&out)[Size], const char* text)
{
    constexpr size_t kHalf = (Size - 3) / 2;
    std::memcpy(out, text, kHalf);
    out[kHalf] = '.';
    out[kHalf + 1] = '.';
    std::memcpy(out + kHalf + 2, text + std::strlen(text) - kHalf, kHalf + 1);
}

} // namespace

namespace zvplat {

bool tFixedStatus::set(int32_t newCode, const char* newComponent, const char* newFile,
                       uint32_t newLine)
{
    if (!zverr_codeReplaces(newCode, code)) return false;
    code = newCode;
    if (size < kStamp) return true;
    copyText(component, newComponent);
    if (std::strlen(newFile) < sizeof file) {
        copyText(file, newFile);
    } else {
        copyBothEnds(file, newFile);
    }
    line = newLine;
    reserved = 0;
    return true;
}

bool tFixedStatus::set(const zverr_RaisingSite& site)
{
    return set(site.code, site.position.component, site.position.file, site.position.line);
}

} // namespace zvplat

void zverr_takeFixedStatus(const zvplat::tFixedStatus& fixed, zverr_Status* status)
{
    if (!zverr_setCode(status, fixed.code)) return; // a code of 0 is never taken
    if (fixed.size < zvplat::tFixedStatus::kStamp) return;
    if (fixed.file[0] != 0) {
        char* position = zverr_reserveJson(status, kRoom);
        if (position != nullptr) position = jsonz_putString(position, "file", fixed.file);
        if (position != nullptr) jsonz_putUInt(position, "line", fixed.line);
    }
    if (fixed.component[0] != 0) {
        char* const position = zverr_reserveJson(status, kRoom);
        if (position != nullptr) jsonz_putString(position, "component", fixed.component);
    }
}
