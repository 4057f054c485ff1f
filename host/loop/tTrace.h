#pragma once

#include "servo/tHostCall.h"
#include "sources/iPairSource.h"
#include "text/tOutputFile.h"

#include <optional>
#include <string>

// Every pair and every host call as one row of a CSV file, in the order they happened. Without a
// file nothing is kept. What did not reach the clock in a dry run is no call, but an order held
// back.
class tTrace
{
public:
    tTrace(const std::string& path, bool isDryRun); // "": none; "-": stdout

    void addPair(const tPair& pair);
    void addCalls(int64_t elapsedNs, const tHostCalls& calls);
    void flush();

private:
    std::optional<tOutputFile> file;
    bool dryRun;
};
