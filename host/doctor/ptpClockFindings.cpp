#include "clocks/tPtpDevice.h"
#include "doctor/findings.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <system_error>

namespace dravikHost {

namespace fs = std::filesystem;

namespace {

std::vector<std::string> allDevices()
{
    std::vector<std::string> devices;
    std::error_code ignored;
    for (const auto& entry : fs::directory_iterator("/dev", ignored)) {
        if (entry.path().filename().string().rfind("ptp", 0) == 0)
            devices.push_back(entry.path().string());
    }
    std::sort(devices.begin(), devices.end());
    return devices;
}

// What its driver calls it; "": it does not.
std::string driverName(const std::string& device)
{
    std::ifstream file(fs::path("/sys/class/ptp") / fs::path(device).filename() / "clock_name");
    std::string name;
    std::getline(file, name);
    return name.empty() ? "" : name + ", ";
}

tFinding look(const std::string& path)
{
    constexpr const char* kTopic = "PTP clock";
    try {
        tPtpDevice device(path);
        const tCrossReading reading = device.crossRead();
        const auto aheadNs = static_cast<int64_t>(reading.clockNs - reading.systemNs);
        const bool writable = access(path.c_str(), W_OK) == 0;
        return {
            writable ? tFinding::kGood : tFinding::kLook, kTopic,
            fmt::format("{}: {}steered up to {}, read by {} within {}, {} from CLOCK_REALTIME{}",
                        path, driverName(path), offsetText(device.maxOffsetPpb()), device.method(),
                        durationText(static_cast<double>(reading.windowNs)),
                        signedDurationText(static_cast<double>(aheadNs)),
                        writable ? "" : "; not to be written here, so not to be steered")};
    } catch (const std::system_error& failure) {
        const bool forbidden = failure.code() == std::errc::permission_denied;
        return {forbidden ? tFinding::kLook : tFinding::kFault, kTopic, failure.what()};
    }
}

} // namespace

tFindings ptpClockFindings(std::vector<std::string> devices)
{
    if (devices.empty()) devices = allDevices();
    if (devices.empty()) return {{tFinding::kLook, "PTP clock", "none: there is no /dev/ptp*"}};
    tFindings findings;
    for (const std::string& device : devices)
        findings.push_back(look(device));
    return findings;
}

} // namespace dravikHost
