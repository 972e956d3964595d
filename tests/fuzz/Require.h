// The check of the fuzzers.
#pragma once

#include <cstdlib>

// Aborts if the condition is false, which the fuzzer reports as a crash.
inline void Require(bool condition)
{
    if (!condition)
        std::abort();
}
