// The function of all entry points of the library: misbehaves as ASSAY_MISBEHAVE says, else returns
// CL_OUT_OF_HOST_MEMORY.
#include <cstdlib>

#include "win/Misbehave.h"

extern "C" int Misbehaving()
{
    constexpr int kOutOfHostMemory = -6;
    const char* const how = std::getenv("ASSAY_MISBEHAVE");
    Misbehave(how != nullptr ? how : "");
    return kOutOfHostMemory;
}
