#pragma once

#include <functional>
#include <string>

// Code and payload of the zverr::Exception that a call raises, as "-52005 {...}"; "" for none.
std::string raisedBy(const std::function<void()>& call);
