// The check of the flags with which a file is opened.
#pragma once

#include <stdexcept>

#include "pmutil/HandleChannel.h"

namespace pmutil {

// Throws std::invalid_argument "OpenFile: bad access flags" or "OpenFile: bad creation flags".
inline void RequireOpenFlags(int access, int creation)
{
    if (access < kOpenRead || access > kOpenReadWrite)
        throw std::invalid_argument("OpenFile: bad access flags");
    if (creation < kOpenExisting || creation > kCreateAlways)
        throw std::invalid_argument("OpenFile: bad creation flags");
}

} // namespace pmutil
