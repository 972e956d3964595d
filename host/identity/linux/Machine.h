// The identity of a Linux machine, or of its recorded files.
#pragma once

#include "identity/Identity.h"
#include "identity/linux/Files.h"
#include "identity/linux/Process.h"

namespace assay_host {

// Collects the adapters, the system and the driver files of the machine whose files these are, for
// a process like this. The version of assay is left empty. Throws only std::bad_alloc. Any thread
// may call.
Identity GetMachineIdentity(const Files& files, const Process& process);

} // namespace assay_host
