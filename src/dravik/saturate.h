#pragma once

#include <cfloat>
#include <cstdint>

// The servo's figures are the same bits on every machine, which leans on plain IEEE arithmetic.
#ifdef __FAST_MATH__
#error "fast-math changes what the servo computes"
#endif
static_assert(FLT_EVAL_METHOD == 0, "double arithmetic in double precision, no more");

// Conversions with a defined answer for every value: truncation toward zero; out of range the
// nearer limit; not a number gives 0.
int32_t saturateToInt32(double value);
uint32_t saturateToUint32(double value);
