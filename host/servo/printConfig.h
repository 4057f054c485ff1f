#pragma once

#include "servo/tServoHost.h"

// The document in force on the standard output. Throws std::runtime_error.
void printConfig(tServoHost& host);
