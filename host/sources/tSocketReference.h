#pragma once

#include "sources/iReference.h"
#include "text/files.h"

#include <string>

namespace dravikHost {

// Samples as datagrams, in the form that refclock producers write into the socket of a time server:
// when it was, by the machine's clock, and by how much the true time was later.
class tSocketReference : public iReference
{
public:
    // Makes the socket, which ends with the object. One that nobody listens to any more is
    // replaced. Throws std::runtime_error.
    explicit tSocketReference(const std::string& path);
    tSocketReference(const tSocketReference&) = delete;
    tSocketReference& operator=(const tSocketReference&) = delete;
    ~tSocketReference() override;

    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return unusableCount; }

private:
    std::string name;
    tDescriptor socket;
    int64_t unusableCount = 0;
};

} // namespace dravikHost
