#pragma once

#include <string>

// A whole file; "-" is the standard input. Throws std::runtime_error with the name and the reason.
std::string readText(const std::string& path);
