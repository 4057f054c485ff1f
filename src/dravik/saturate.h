#pragma once

#include "dravik/arithmetic.h"

#include <cstdint>

// Conversions with a defined answer for every value: truncation toward zero; out of range the
// nearer limit; not a number gives 0.
int32_t saturateToInt32(double value);
uint32_t saturateToUint32(double value);
