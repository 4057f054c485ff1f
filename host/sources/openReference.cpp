#include "sources/iReference.h"

#include "clocks/systemTime.h"
#include "clocks/tPtpDevice.h"
#include "text/words.h"

#include <charconv>

namespace dravikHost {

namespace {

std::optional<int> unitIn(const std::string& name)
{
    constexpr int kLastUnit = 255;
    const auto text = afterPrefix(name, "shm:");
    if (!text) return std::nullopt;
    int unit = 0;
    const char* const end = text->data() + text->size();
    const auto result = std::from_chars(text->data(), end, unit);
    if (result.ec != std::errc() || result.ptr != end || unit < 0 || unit > kLastUnit)
        return std::nullopt;
    return unit;
}

} // namespace

bool isReferenceName(const std::string& name)
{
    return isReadOnDemand(name) || unitIn(name) || afterPrefix(name, "sock:");
}

bool isReadOnDemand(const std::string& name)
{
    return name == "realtime" || afterPrefix(name, "phc:");
}

std::unique_ptr<iReference> openReference(const std::string& name, int64_t intervalNs)
{
    if (const auto unit = unitIn(name)) return sharedMemoryReference(*unit);
    if (const auto path = afterPrefix(name, "sock:")) return socketReference(*path);
    if (const auto path = afterPrefix(name, "phc:")) {
        const auto device = std::make_shared<tPtpDevice>(*path);
        return clockReference(intervalNs, [device] { return device->crossRead(); });
    }
    return clockReference(intervalNs, readSystemItself);
}

} // namespace dravikHost
