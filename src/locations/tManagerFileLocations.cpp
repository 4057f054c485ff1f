#include "locations/tManagerFileLocations.h"

#include "zvhostq/stdpath.h"

#include <boost/filesystem/operations.hpp>
#include <syslog.h>

using boost::filesystem::path;

namespace {

// A standard directory: who tells it, its usual place, and the warning when that is taken instead.
struct tQuery {
    void (*get)(std::string&);
    const char* fallback;
    void (*warn)();
};

// clang-format off
constexpr tQuery kMultiarchlibdir = {zvhostq::get_multiarchlibdir, "/usr/lib/arm-linux-gnueabi",
    [] { syslog(LOG_WARNING, "zvhostq::get_multiarchlibdir() failed"); }};
constexpr tQuery kSharedDir = {zvhostq::getZVSharedDir, "/usr/local/zvcorp/shared",
    [] { syslog(LOG_WARNING, "zvhostq::getZVSharedDir() failed"); }};
constexpr tQuery kBindir = {zvhostq::get_bindir, "/usr/bin",
    [] { syslog(LOG_WARNING, "zvhostq::get_bindir() failed"); }};
constexpr tQuery kRunstatedir = {zvhostq::get_runstatedir, "/var/run",
    [] { syslog(LOG_WARNING, "zvhostq::get_runstatedir() failed"); }};
constexpr tQuery kSysconfdir = {zvhostq::get_sysconfdir, "/etc",
    [] { syslog(LOG_WARNING, "zvhostq::get_sysconfdir() failed"); }};
constexpr tQuery kSharedstatedir = {zvhostq::get_sharedstatedir, "/var/lib",
    [] { syslog(LOG_WARNING, "zvhostq::get_sharedstatedir() failed"); }};
constexpr tQuery kLocalstatedir = {zvhostq::get_localstatedir, "/var",
    [] { syslog(LOG_WARNING, "zvhostq::get_localstatedir() failed"); }};
// clang-format on

path ask(const tQuery& query)
{
    std::string directory;
    try {
        query.get(directory);
    } catch (...) {
        query.warn();
        directory = query.fallback;
    }
    return directory;
}

path findBaseDir(bool& standard)
{
    path directory = ask(kMultiarchlibdir) / "zv-chronel";
    standard = boost::filesystem::exists(directory);
    return standard ? directory : ask(kSharedDir) / "Chronel";
}

// The tool is looked for in the shared layout only.
path findCommandLineTool(bool standard)
{
    path tool = ask(kBindir) / "zvchronelcli";
    if (standard || boost::filesystem::exists(tool)) return tool;
    return ask(kSharedDir) / "Chronel" / "zvchronelcli";
}

// The daemon is looked for in either layout.
path findDaemon()
{
    path daemon = ask(kBindir) / "zvckmd";
    if (boost::filesystem::exists(daemon)) return daemon;
    return ask(kSharedDir) / "Chronel" / "zvckmd";
}

} // namespace

tManagerFileLocations::tManagerFileLocations()
    : usesStandardLayout(true), baseDir(findBaseDir(usesStandardLayout)),
      configGeneratorPath(
          (usesStandardLayout ? baseDir / "configgen" : baseDir / "Config" / "configGen").string()),
      commandLineToolPath(findCommandLineTool(usesStandardLayout).string()),
      timeReferencesDir(baseDir / (usesStandardLayout ? "timereferences" : "TimeReferences")),
      timekeepersDir(baseDir / (usesStandardLayout ? "timekeepers" : "TimeKeepers")),
      servosDir(baseDir / (usesStandardLayout ? "servos" : "Servos")),
      runtimeDir(usesStandardLayout ? ask(kRunstatedir) / "zv-chronel"
                                    : ask(kRunstatedir) / "zvcorp" / "Chronel"),
      runtimeFile((runtimeDir / "runtime_ckm.json").string()),
      configDir(usesStandardLayout ? ask(kSysconfdir)
                                   : ask(kSysconfdir) / "zvcorp" / "share" / "Chronel"),
      stateDir(usesStandardLayout ? ask(kSharedstatedir) / "zv-chronel" : baseDir),
      managerConfigFile((stateDir / "ckm.json").string()),
      syncConfigFile((ask(kSharedstatedir) / "zv-sync" / "syncConfig.txt").string()),
      pidFile((ask(kRunstatedir) / "zvckmd.pid").string()), daemonPath(findDaemon().string()),
      logFile((ask(kLocalstatedir) / "log" / "zvckmd.log").string())
{}
