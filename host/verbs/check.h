#pragma once

#include "text/options.h"

// dravik-host check: a configuration document as the plug-in takes it, or why it does not.
tVerb addCheck(CLI::App& app);
