#pragma once

#include <exception>
#include <string>

// What the action throws, in words; "" if it throws nothing.
template <typename Action> std::string failureOf(Action action)
{
    try {
        action();
    } catch (const std::exception& failure) {
        return failure.what();
    }
    return "";
}
