// Prints where everything lies, as it was settled before main, for places_test.sh. The environment
// names a file in place of /etc/zvcorp/share/share.dir, and an allocation that fails before main.

#include "dravik/defaultConfigFiles.h"
#include "locations/tManagerFileLocations.h"
#include "support/allocator.h"
#include "support/systemLog.h"
#include "zverr/Exception.h"
#include "zvhostq/stdpath.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>

namespace {

int sharedDirReads = 0;

// Fails one allocation of the load, ahead of everything else in it.
long failingAllocation()
{
    const char* const number = std::getenv("FAIL_ALLOCATION");
    return number != nullptr ? std::strtol(number, nullptr, 10) : 0;
}
[[gnu::init_priority(101)]] std::optional<allocator::tFailNth> failing(std::in_place,
                                                                       failingAllocation());

void print(const char* name, const std::string& value)
{
    std::printf("%s %s\n", name, value.c_str());
}

void printGetter(const char* name, void (*get)(std::string&))
{
    std::string path = "old";
    try {
        get(path);
        print(name, path);
    } catch (const zverr::Exception& failure) {
        print(name, path + std::to_string(failure.status.code) + " " + failure.what());
    } catch (const std::exception& failure) {
        print(name, path + failure.what());
    }
}

} // namespace

extern "C" FILE* __real_fopen(const char* path, const char* mode);
extern "C" FILE* __wrap_fopen(const char* path, const char* mode)
{
    const char* const instead = std::getenv("SHARE_DIR_FILE");
    const bool shared = std::strcmp(path, "/etc/zvcorp/share/share.dir") == 0;
    if (shared) ++sharedDirReads;
    return __real_fopen(shared && instead != nullptr ? instead : path, mode);
}

int main()
{
    const bool fired = failing->fired();
    failing.reset();
    for (const std::string& line : takeSystemLog()) {
        print("log", line);
    }
    std::printf("sharedDirReads %d\n", sharedDirReads);
    std::printf("allocationFailed %d\n", fired ? 1 : 0);
    for (const auto& [type, path] : defaultConfigFiles) {
        print("default", path);
    }
    printGetter("bindir", zvhostq::get_bindir);
    printGetter("localstatedir", zvhostq::get_localstatedir);
    printGetter("sharedstatedir", zvhostq::get_sharedstatedir);
    printGetter("multiarchlibdir", zvhostq::get_multiarchlibdir);
    printGetter("runstatedir", zvhostq::get_runstatedir);
    printGetter("sysconfdir", zvhostq::get_sysconfdir);
    printGetter("sharedDir", zvhostq::getZVSharedDir);
    try {
        const tManagerFileLocations at;
        print("baseDir", at.baseDir.string());
        print("configGeneratorPath", at.configGeneratorPath);
        print("commandLineToolPath", at.commandLineToolPath);
        print("timeReferencesDir", at.timeReferencesDir.string());
        print("timekeepersDir", at.timekeepersDir.string());
        print("servosDir", at.servosDir.string());
        print("runtimeDir", at.runtimeDir.string());
        print("runtimeFile", at.runtimeFile);
        print("configDir", at.configDir.string());
        print("stateDir", at.stateDir.string());
        print("managerConfigFile", at.managerConfigFile);
        print("syncConfigFile", at.syncConfigFile);
        print("pidFile", at.pidFile);
        print("daemonPath", at.daemonPath);
        print("logFile", at.logFile);
    } catch (const std::exception& failure) {
        print("locations", failure.what());
    }
    return 0;
}
