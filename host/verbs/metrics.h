#pragma once

#include "text/options.h"

// dravik-host metrics: what a trace is worth, and whether it holds what it has to.
tVerb addMetrics(CLI::App& app);
