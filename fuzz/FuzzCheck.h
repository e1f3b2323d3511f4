// The check of the fuzz targets: a violated property stops the run with a trap that libFuzzer (or
// the replay driver, through the signal) reports together with the input.
#pragma once

#include <cstdio>

#define FUZZ_CHECK(cond)                                                                                     \
    do {                                                                                                     \
        if (!(cond)) {                                                                                       \
            std::fprintf(stderr, "check failed: %s (%s:%d)\n", #cond, __FILE__, __LINE__);                   \
            __builtin_trap();                                                                                \
        }                                                                                                    \
    } while (0)
