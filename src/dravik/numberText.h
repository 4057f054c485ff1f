#pragma once

#include <string>

// A finite number as JSON text, whatever the locale: 15 significant digits, or 17 where those would
// not read back as the very same double. 1 is `1`, 1e-6 is `1e-06`, -0.0 is `-0`.
std::string numberText(double value);
