#pragma once

#include "traces/tRecording.h"

// What remains of a recording without its corrections.

// Throws std::runtime_error if the recording does not tell what frequency its clock was given.
void requireCorrections(const tRecording& recording);

// By how many ns the oscillator and the noise, without the corrections, changed the error from one
// measurement to another, a later one that follows it.
double ownErrorNs(const tRecordedPair& from, const tRecordedPair& to);
