#include "servo/tStatus.h"

#include "text/json.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>

namespace dravikHost {

namespace {

constexpr char kEndMark = 'J';

// See zverr_ReallocJsonFn. Plain C inside, so that nothing can be thrown.
extern "C" bool hostReallocJson(zverr_Status* status, uint32_t size)
{
    if (size == 0) {
        std::free(status->json);
        status->json = nullptr;
        status->capacity = 0;
        return true;
    }
    if (size <= status->capacity) return true;
    const bool first = status->json == nullptr;
    size = std::max<uint32_t>(size, sizeof "{}" + 1);
    char* const grown = static_cast<char*>(std::realloc(status->json, size));
    if (grown == nullptr) return false;
    if (first) std::memcpy(grown, "{}", sizeof "{}");
    const uint32_t kept = first ? sizeof "{}" : status->capacity - 1; // all but the old end mark
    std::memset(grown + kept, 0, size - 1 - kept);
    grown[size - 1] = kEndMark;
    status->json = grown;
    status->capacity = size;
    return true;
}

void writePayload(zverr_Status* status, const std::string& text)
{
    if (!status->reallocJson(status, static_cast<uint32_t>(text.size() + 2))) return;
    std::memset(status->json, 0, status->capacity - 1);
    std::memcpy(status->json, text.data(), text.size());
}

} // namespace

tStatus::tStatus() : zverr_Status{0, 0, hostReallocJson, nullptr} {}

tStatus::~tStatus() { hostReallocJson(this, 0); }

std::string tStatus::details() const { return json != nullptr ? json : "no details"; }

void tStatus::check(const char* what) const
{
    if (code >= 0) return;
    throw std::runtime_error(fmt::format("{} failed with {}: {}", what, code, details()));
}

void setFailure(zverr_Status* status, int32_t code, const char* message) noexcept
{
    if (status->code < 0) return;
    status->code = code;
    try {
        writePayload(status, tJsonObject().add("message", jsonQuoted(message)).line());
    } catch (...) { // NOLINT(bugprone-empty-catch): the code stands without its details
    }
}

} // namespace dravikHost
