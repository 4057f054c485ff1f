#pragma once

#include "text/options.h"

// dravik-host replay: runs the plug-in on a recorded trace.
tVerb addReplay(CLI::App& app);
