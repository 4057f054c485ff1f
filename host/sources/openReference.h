#pragma once

#include "sources/iReference.h"

#include <memory>
#include <string>

namespace dravikHost {

// "realtime", "phc:DEVICE", "shm:UNIT" or "sock:PATH".
bool isReferenceName(const std::string& name);

// Whether it is read at the pace of this program; the others come at the producer's.
bool isReadOnDemand(const std::string& name);

// Throws std::runtime_error that names what cannot be opened.
std::unique_ptr<iReference> openReference(const std::string& name, int64_t intervalNs);

} // namespace dravikHost
