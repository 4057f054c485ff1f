#pragma once

#include <functional>
#include <string>

// What a library writes to the system log meanwhile, which is its only way to tell. Exceptions of
// the action are caught; their text is in failure.
struct tLogged {
    std::string log;
    std::string failure; // "": none
};
tLogged loggedDuring(const std::function<void()>& action);
