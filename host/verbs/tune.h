#pragma once

#include "text/options.h"

// dravik-host tune: writes the document that suits a noise, given or found in a trace.
tVerb addTune(CLI::App& app);
