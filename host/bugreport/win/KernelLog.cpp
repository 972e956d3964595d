#include "bugreport/KernelLog.h"

namespace assay_host {

KernelLog ReadKernelLog(const KernelLogSource& /*source*/)
{
    return {{}, "Windows has them in the event log: Event Viewer, System, source Display"};
}

} // namespace assay_host
