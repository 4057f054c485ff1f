#pragma once

#include "zvckmservo/servo.h"

#include <memory>
#include <string>

namespace dravikHost {

// The plug-in, loaded at run time and unloaded at the end of the scope.
class tServoLibrary
{
public:
    // The file asked for, or else the one named by DRAVIK_LIBRARY, or else libdravik.so.1 beside
    // this program, or where it is installed, or where the loader finds it.
    static std::string find(const std::string& asked);

    // Throws std::runtime_error if the file cannot be loaded or lacks one of the nine functions.
    explicit tServoLibrary(const std::string& file);

    const std::string path;

    // All nine, used here or not: a library that lacks one is not the plug-in.
    decltype(&zvckmservo_initialize) initialize;
    decltype(&zvckmservo_finalize) finalize;
    decltype(&zvckmservo_isSeeded) isSeeded;
    decltype(&zvckmservo_clearHistory) clearHistory;
    decltype(&zvckmservo_adjustTime) adjustTime;
    decltype(&zvckmservo_getTime) getTime;
    decltype(&zvckmservo_writeServoConfigJson) writeServoConfigJson;
    decltype(&zvckmservo_readServoConfigJson) readServoConfigJson;
    decltype(&zvckmservo_applyMetaData) applyMetaData;

private:
    template <typename Function> void bind(Function& function, const char* name);

    struct tCloser {
        void operator()(void* opened) const;
    };
    std::unique_ptr<void, tCloser> handle;
};

} // namespace dravikHost
