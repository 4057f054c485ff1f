#include "tServoLibrary.h"

#include <fmt/format.h>

#include <cstdlib>
#include <dlfcn.h>
#include <filesystem>
#include <stdexcept>

std::string tServoLibrary::find(const std::string& asked)
{
    if (!asked.empty()) return asked;
    const char* named = std::getenv("DRAVIK_LIBRARY"); // NOLINT(concurrency-mt-unsafe)
    if (named != nullptr && *named != '\0') return named;
    return std::filesystem::read_symlink("/proc/self/exe").replace_filename("libdravik.so.1");
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
