#pragma once

namespace dravikHost {

// Functions whose results are the same bits on every machine, which those of the C library are not.

double logarithm(double value);     // natural, of a positive number
double sineOfTurns(double turns);   // of 2 pi turns
double cosineOfTurns(double turns); // of 2 pi turns

} // namespace dravikHost
