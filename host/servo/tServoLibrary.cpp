#include "servo/tServoLibrary.h"

#include <fmt/format.h>

#include <cstdlib>
#include <dlfcn.h>
#include <filesystem>
#include <stdexcept>

namespace dravikHost {

namespace fs = std::filesystem;

namespace {

constexpr const char* kFileName = "libdravik.so.1";
constexpr const char* kInstalledFolder = DRAVIK_LIB_FROM_BIN; // seen from the installed program

} // namespace

std::string tServoLibrary::find(const std::string& asked)
{
    if (!asked.empty()) return asked;
    const char* named = std::getenv("DRAVIK_LIBRARY"); // NOLINT(concurrency-mt-unsafe)
    if (named != nullptr && *named != '\0') return named;
    const fs::path folder = fs::read_symlink("/proc/self/exe").parent_path();
    for (const fs::path& candidate : {folder / kFileName, folder / kInstalledFolder / kFileName}) {
        if (fs::exists(candidate)) return candidate;
    }
    return kFileName; // wherever the loader finds it
}

tServoLibrary::tServoLibrary(const std::string& file)
    : path(file), handle(dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL))
{
    if (!handle) throw std::runtime_error(fmt::format("cannot load the plug-in: {}", dlerror()));
    bind(initialize, "zvckmservo_initialize");
    bind(finalize, "zvckmservo_finalize");
    bind(isSeeded, "zvckmservo_isSeeded");
    bind(clearHistory, "zvckmservo_clearHistory");
    bind(adjustTime, "zvckmservo_adjustTime");
    bind(getTime, "zvckmservo_getTime");
    bind(writeServoConfigJson, "zvckmservo_writeServoConfigJson");
    bind(readServoConfigJson, "zvckmservo_readServoConfigJson");
    bind(applyMetaData, "zvckmservo_applyMetaData");
}

template <typename Function> void tServoLibrary::bind(Function& function, const char* name)
{
    function = reinterpret_cast<Function>(dlsym(handle.get(), name));
    if (function == nullptr)
        throw std::runtime_error(fmt::format("{} is not the plug-in: it has no {}", path, name));
}

void tServoLibrary::tCloser::operator()(void* opened) const { dlclose(opened); }

} // namespace dravikHost
