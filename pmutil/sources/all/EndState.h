// The state of an application whose child has ended.
#pragma once

#include "pmutil/Launcher.h"

namespace pmutil {

// Undefined for a value that no launcher gives.
inline State GetEndState(int result)
{
    switch (result) {
    case kEndedNormally:
        return State::kFinished;
    case kEndedByCrash:
        return State::kCrashed;
    case kEndedByKill:
        return State::kKilled;
    default:
        return State::kUndefined;
    }
}

} // namespace pmutil
