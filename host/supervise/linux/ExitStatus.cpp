#include "supervise/ExitStatus.h"

namespace assay_host {

// Linux reports the low byte.
std::int64_t GetReportedStatus(std::int32_t returned)
{
    return returned & 0xFF;
}

} // namespace assay_host
