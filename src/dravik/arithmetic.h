#pragma once

#include <cfloat>

// The servo's figures are the same bits on every machine, which leans on plain IEEE arithmetic in
// every unit that computes with double. Included by the types that they all share.
#ifdef __FAST_MATH__
#error "fast-math changes what the servo computes"
#endif
static_assert(FLT_EVAL_METHOD == 0, "double arithmetic in double precision, no more");
