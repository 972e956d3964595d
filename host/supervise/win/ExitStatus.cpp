#include "supervise/ExitStatus.h"

namespace assay_host {

// Windows reports all bits, as an unsigned number.
std::int64_t GetReportedStatus(std::int32_t returned)
{
    return static_cast<std::uint32_t>(returned);
}

} // namespace assay_host
