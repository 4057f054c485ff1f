#pragma once

#include "zverr/status.h"

#include <cstdint>
#include <string>
#include <vector>

// A host's own status record with a foreign reallocJson that gives exactly what is asked, notes
// each request, and can be told to refuse, to throw or to lie. Checks the buffer's form when it
// ends.
class tHostStatus
{
public:
    explicit tHostStatus(int32_t code = 0, const char* text = nullptr);
    ~tHostStatus();
    tHostStatus(const tHostStatus&) = delete;
    tHostStatus& operator=(const tHostStatus&) = delete;

    void reset(); // empty again
    int32_t code() const { return record.code; }
    std::string text() const; // "(none)" without a buffer

    zverr_Status record;
    std::vector<uint32_t> requests;
    enum tMode { kGive, kRefuse, kThrow, kGrantNothing } mode = kGive;
    uint32_t largest = UINT32_MAX; // larger requests are refused
};

extern "C" bool foreignReallocJson(zverr_Status* status, uint32_t size);

// Asserts the form of a payload buffer: text, zero, zeros, end mark.
void expectBufferForm(const zverr_Status& status);
