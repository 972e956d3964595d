#include "supervise/ErrorDialogs.h"

#include <windows.h>

namespace assay_host {

void KeepDialogsAway()
{
    ::SetErrorMode(::GetErrorMode() | SEM_FAILCRITICALERRORS | SEM_NOGPFAULTERRORBOX |
                   SEM_NOOPENFILEERRORBOX);
}

} // namespace assay_host
