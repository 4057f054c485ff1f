#pragma once

#include "zvplat/tFixedStatus.h"

namespace zvplat {

// Lets the holder of a status call an operation that wants a fixed record, within one expression:
//
//     char* buffer = zvplat::newArray(255, zvplat::tFixedStatusAdapter(status).get());
//
// The record starts with what the status holds, so that a failure stops the operation, and at the
// end of the scope a failure of the operation goes into the status. Of a long component or file in
// the status the record shows the end.
class tFixedStatusAdapter
{
public:
    explicit tFixedStatusAdapter(zverr_Status* status);
    ~tFixedStatusAdapter();
    tFixedStatusAdapter(const tFixedStatusAdapter&) = delete;
    tFixedStatusAdapter& operator=(const tFixedStatusAdapter&) = delete;

    tFixedStatus* get() { return &record; }

private:
    tFixedStatus record;
    zverr_Status* status; // borrowed
};

} // namespace zvplat
