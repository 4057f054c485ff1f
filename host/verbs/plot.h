#pragma once

#include "text/options.h"

// dravik-host plot: draws a trace.
tVerb addPlot(CLI::App& app);
