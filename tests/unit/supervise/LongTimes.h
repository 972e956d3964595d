// Times of runs whose outcome must not depend on the machine's speed.
#pragma once

#include "supervise/RunTimes.h"
#include "support/Waits.h"

namespace assay_host {

// Long enough on a busy machine for all that ends.
inline RunTimes GetLongTimes()
{
    RunTimes times;
    times.fKillGrace = times.fLastStreamGrace = RunTimes::Seconds(pmutil::kLong);
    times.fTreeSeconds = times.fJoinSeconds = pmutil::kLong;
    return times;
}

} // namespace assay_host
