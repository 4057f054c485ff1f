#pragma once

#include "text/options.h"

tVerb addDoctor(CLI::App& app);
