#pragma once

#include "clocks/iClock.h"
#include "text/files.h"

#include <ctime>
#include <optional>
#include <string>

namespace dravikHost {

// A PTP hardware clock, by the name of its device.
class tPtpDevice
{
public:
    // Throws std::system_error that names the device.
    explicit tPtpDevice(const std::string& path);

    clockid_t clock() const;
    int32_t maxOffsetPpb() const { return limitPpb; }

    // In the most exact way that the device knows; throws std::system_error.
    tCrossReading crossRead();
    const char* method() const; // of the latest reading, for people

private:
    enum tMethod { kPrecise, kExtended, kBasic };
    std::optional<tCrossReading> read(tMethod which) const;
    std::optional<tCrossReading> readPrecise() const;
    std::optional<tCrossReading> readExtended() const;
    std::optional<tCrossReading> readBasic() const;
    bool ask(unsigned long request, void* argument) const;

    std::string name;
    tDescriptor file;
    int32_t limitPpb = 0;
    tMethod latest = kPrecise;
};

} // namespace dravikHost
