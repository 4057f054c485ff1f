#pragma once

#include "text/options.h"

// dravik-host show: the configuration document in force of a new servo, or of one so tuned.
tVerb addShow(CLI::App& app);
