#include "dravik/defaultConfigFiles.h"

#include "locations/tManagerFileLocations.h"
#include "zvplat/quarks/cancellation.h"

#include <syslog.h>

namespace {

constexpr const char* kTabType = "IEEE 802.1AS-2011 TAB";
constexpr const char* kBcType = "IEEE 1588-2008 BC";

// An exception out of an initialiser would end the host. The type then has no default document.
std::string pathOrNone(std::string (*getPath)(), const char* type) noexcept
{
    try {
        return getPath();
    } catch (...) {
        syslog(LOG_WARNING, "no default configuration for %s: its place cannot be told", type);
        return {};
    }
}

void addRow(std::map<std::string, std::string>& table, const char* type, const std::string& path)
{
    if (!path.empty()) table.emplace(type, path);
}

std::map<std::string, std::string> buildTable() noexcept
{
    const tCancellationPause pause; // it looks at files and may log
    const std::string tabPath = pathOrNone(getTabConfigPath, kTabType);
    const std::string bcPath = pathOrNone(getBcConfigPath, kBcType);
    std::map<std::string, std::string> table;
    try {
        addRow(table, kTabType, tabPath);
        addRow(table, kBcType, bcPath);
    } catch (...) {
        syslog(LOG_WARNING, "no memory for the default configurations");
    }
    return table;
}

} // namespace

// Ahead of the initialisers of other units, which settle directories on their own.
[[gnu::init_priority(1000)]] const std::map<std::string, std::string> defaultConfigFiles =
    buildTable();

std::string getTabConfigPath()
{
    return (tManagerFileLocations().getServosDir() / "dravik_tr_ptp4l_tab.json").string();
}

std::string getBcConfigPath()
{
    return (tManagerFileLocations().getServosDir() / "dravik_tr_ptp4l_bc.json").string();
}
