#pragma once

#include <cstdint>

// Logs tell differences of time and moments of their own. Their references start here, so that no
// difference, however negative, takes a clock below zero.
constexpr uint64_t kMadeUpStartNs = 1'700'000'000'000'000'000;
