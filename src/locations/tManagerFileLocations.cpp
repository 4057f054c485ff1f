#include "locations/tManagerFileLocations.h"

#include "zvhostq/stdpath.h"

#include <boost/filesystem/operations.hpp>
#include <syslog.h>

using boost::filesystem::path;

namespace {

// A standard directory, or a warning and its usual place.
template <class Warn> path ask(void (*getter)(std::string&), Warn warn, const char* fallback)
{
    std::string directory;
    try {
        getter(directory);
    } catch (...) {
        warn();
        directory = fallback;
    }
    return directory;
}

path multiarchlibdir()
{
    return ask(
        zvhostq::get_multiarchlibdir,
        [] { syslog(LOG_WARNING, "zvhostq::get_multiarchlibdir() failed"); },
        "/usr/lib/arm-linux-gnueabi");
}

path sharedDir()
{
    return ask(
        zvhostq::getZVSharedDir, [] { syslog(LOG_WARNING, "zvhostq::getZVSharedDir() failed"); },
        "/usr/local/zvcorp/shared");
}

path bindir()
{
    return ask(
        zvhostq::get_bindir, [] { syslog(LOG_WARNING, "zvhostq::get_bindir() failed"); },
        "/usr/bin");
}

path runstatedir()
{
    return ask(
        zvhostq::get_runstatedir, [] { syslog(LOG_WARNING, "zvhostq::get_runstatedir() failed"); },
        "/var/run");
}

path sysconfdir()
{
    return ask(
        zvhostq::get_sysconfdir, [] { syslog(LOG_WARNING, "zvhostq::get_sysconfdir() failed"); },
        "/etc");
}

path sharedstatedir()
{
    return ask(
        zvhostq::get_sharedstatedir,
        [] { syslog(LOG_WARNING, "zvhostq::get_sharedstatedir() failed"); }, "/var/lib");
}

path localstatedir()
{
    return ask(
        zvhostq::get_localstatedir,
        [] { syslog(LOG_WARNING, "zvhostq::get_localstatedir() failed"); }, "/var");
}

path findBaseDir(bool& standard)
{
    path directory = multiarchlibdir() / "zv-chronel";
    standard = boost::filesystem::exists(directory);
    return standard ? directory : sharedDir() / "Chronel";
}

// The tool is looked for in the shared layout only.
path findCommandLineTool(bool standard)
{
    path tool = bindir() / "zvchronelcli";
    if (standard || boost::filesystem::exists(tool)) return tool;
    return sharedDir() / "Chronel" / "zvchronelcli";
}

// The daemon is looked for in either layout.
path findDaemon()
{
    path daemon = bindir() / "zvckmd";
    if (boost::filesystem::exists(daemon)) return daemon;
    return sharedDir() / "Chronel" / "zvckmd";
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
      runtimeDir(usesStandardLayout ? runstatedir() / "zv-chronel"
                                    : runstatedir() / "zvcorp" / "Chronel"),
      runtimeFile((runtimeDir / "runtime_ckm.json").string()),
      configDir(usesStandardLayout ? sysconfdir() : sysconfdir() / "zvcorp" / "share" / "Chronel"),
      stateDir(usesStandardLayout ? sharedstatedir() / "zv-chronel" : baseDir),
      managerConfigFile((stateDir / "ckm.json").string()),
      syncConfigFile((sharedstatedir() / "zv-sync" / "syncConfig.txt").string()),
      pidFile((runstatedir() / "zvckmd.pid").string()), daemonPath(findDaemon().string()),
      logFile((localstatedir() / "log" / "zvckmd.log").string())
{}
