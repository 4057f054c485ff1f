#pragma once

#include "zverr/status.h"

#include <string>

namespace dravikHost {

// A status record of this host, with a buffer of its own. It is empty at first.
struct tStatus : zverr_Status {
    tStatus();
    tStatus(const tStatus&) = delete;
    tStatus& operator=(const tStatus&) = delete;
    ~tStatus();

    std::string details() const; // the payload

    // Throws std::runtime_error with code and payload if the code is negative.
    void check(const char* what) const;
};

// Reports a failure in a record of either side, unless it already holds one.
void setFailure(zverr_Status* status, int32_t code, const char* message) noexcept;

} // namespace dravikHost
