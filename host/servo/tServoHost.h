#pragma once

#include "clocks/iClock.h"
#include "servo/tHostCall.h"
#include "servo/tServoLibrary.h"
#include "servo/tStatus.h"

#include <exception>
#include <string>

namespace dravikHost {

// One clock under the plug-in's discipline: initialised with the scope, finalised at its end.
class tServoHost
{
public:
    // Library and clock are borrowed. Throws as adjustTime does.
    tServoHost(const tServoLibrary& library, iClock& clock);
    tServoHost(const tServoHost&) = delete; // the plug-in keeps the address of the table
    tServoHost& operator=(const tServoHost&) = delete;
    ~tServoHost();

    // Throws what the clock threw, or else std::runtime_error with the plug-in's code and payload;
    // the calls made until then are kept.
    void adjustTime(uint64_t referenceNs, uint64_t clockNs);

    // Forgets what it measured. Throws std::runtime_error.
    void clearHistory();

    // The texts of the plug-in. Throw std::runtime_error; of a refused document it says why.
    void writeConfig(const std::string& document);
    std::string readConfig();
    void applyMetaData(const std::string& metaData);

    // What the plug-in asked of the clock during the last pair, or during initialisation.
    const tHostCalls& calls() const { return subject.calls; }

    // What the operations work on, as they are given no pointer to it.
    struct tSubject {
        iClock& clock;
        tHostCalls calls;
        std::exception_ptr failure; // of the clock, in the latest call
    };

private:
    void check(const tStatus& status, const char* what);

    const tServoLibrary& library;
    tSubject subject;
    zvckmservo_HostTable table;
};

} // namespace dravikHost
