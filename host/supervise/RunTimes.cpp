#include "supervise/RunTimes.h"

namespace assay_host {

RunTimes& DefaultRunTimes()
{
    static RunTimes times;
    return times;
}

} // namespace assay_host
