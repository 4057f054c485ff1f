#pragma once

#include <cstdio>
#include <cstdlib>

// What must hold for every input. Aborts, which is how a fuzzer learns of a finding.
#define REQUIRE(condition)                                                                         \
    do {                                                                                           \
        if (!(condition)) {                                                                        \
            (void)std::fprintf(stderr, "%s:%d: %s\n", __FILE__, __LINE__, #condition);             \
            std::abort();                                                                          \
        }                                                                                          \
    } while (false)
