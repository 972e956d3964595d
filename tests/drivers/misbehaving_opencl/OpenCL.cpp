// Every entry point of the library: misbehaves in the program that calls it, as ASSAY_MISBEHAVE
// says, else fails.
#include <cstdlib>

#include "win/Misbehave.h"

extern "C" int Misbehaving()
{
    constexpr int kOutOfHostMemory = -6;
    const char* const how = std::getenv("ASSAY_MISBEHAVE");
    Misbehave(how != nullptr ? how : "");
    return kOutOfHostMemory;
}
