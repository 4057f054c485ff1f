#pragma once

#include "servo/tHostCall.h"
#include "sources/iPairSource.h"
#include "text/tOutputFile.h"

#include <optional>
#include <string>

// Every pair and every host call as one row of a CSV file, in the order they happened. Without a
// file nothing is kept.
class tTrace
{
public:
    explicit tTrace(const std::string& path); // "": none; "-": stdout

    void addPair(const tPair& pair);
    void addCalls(int64_t elapsedNs, const tHostCalls& calls);
    void flush();

private:
    std::optional<tOutputFile> file;
};
