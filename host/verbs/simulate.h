#pragma once

#include "text/options.h"

// dravik-host simulate: a modelled clock in a closed loop, as fast as it goes.
tVerb addSimulate(CLI::App& app);
