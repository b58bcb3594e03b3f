// What the fuzz targets share: a check that stops the run, naming the property that broke.
#pragma once

#include <cstdio>
#include <cstdlib>

// Aborts, so that libFuzzer keeps the input, when a property of the code under test fails.
#define FUZZ_CHECK(condition)                                                                     \
    do {                                                                                          \
        if (!(condition)) {                                                                       \
            std::fprintf(stderr, "%s:%d: property failed: %s\n", __FILE__, __LINE__, #condition); \
            std::abort();                                                                         \
        }                                                                                         \
    } while (0)
