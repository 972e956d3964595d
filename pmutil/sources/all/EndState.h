// Converts the result of a launcher's Wait to a state.
#pragma once

#include "pmutil/Launcher.h"

namespace pmutil {

// Returns Undefined for a value that isn't a WaitResult.
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
