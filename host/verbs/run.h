#pragma once

#include "text/options.h"

// dravik-host run: a clock of the program's own, in real time.
tVerb addRun(CLI::App& app);
