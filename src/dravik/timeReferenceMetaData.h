#pragma once

#include <string>

// The type of the selected time reference in the metadata that a host gives; "" if none is told:
//
//     {"selectedTRInstID": "a", "TRs": {"a": {"type": "IEEE 1588-2008 BC"}}}
//
// Keys, the identifier included, are found without regard to case. Other members may be anything.
// Raises zverr::Exception for text that is not JSON and for members of another type.
std::string getSelectedTimeReferenceType(const std::string& metaDataJson);
