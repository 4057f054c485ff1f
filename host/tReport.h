#pragma once

#include "iPairSource.h"
#include "tHostCall.h"
#include "tLockObserver.h"
#include "tOutputFile.h"
#include "tProgress.h"

#include <string>

// What the person at the terminal sees while it happens.
class tReport
{
public:
    explicit tReport(bool stdoutTaken); // then it goes to stderr

    void print(const std::string& text);
    void event(const tPair& pair, tLockEvent event, const tHostCalls& calls);
    void progress(const tPair& pair, bool locked);

private:
    tOutputFile output;
    tProgress line;
};
