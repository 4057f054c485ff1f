#pragma once

#include "loop/tLockObserver.h"
#include "loop/tProgress.h"
#include "servo/tHostCall.h"
#include "sources/iPairSource.h"
#include "text/tOutputFile.h"

#include <string>

// What the person at the terminal sees while it happens.
class tReport
{
public:
    explicit tReport(bool stdoutTaken); // then it goes to stderr

    void print(const std::string& text);
    void event(const tPair& pair, tLockEvent event, const tHostCalls& calls);
    void note(int64_t elapsedNs, const std::string& text); // "": nothing to say
    void progressText(const std::string& text);            // in place of what it said before
    void progress(const tPair& pair, bool locked);

private:
    tOutputFile output;
    tProgress line;
};
