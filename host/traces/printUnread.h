#pragma once

#include "traces/tRecording.h"

// Tells on stderr how many lines of the trace were no measurements, and which are the first.
void printUnread(const tRecording& recording);
