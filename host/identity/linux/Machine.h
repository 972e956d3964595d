// The identity of a Linux machine, or of its recorded files.
#pragma once

#include <map>
#include <string>

#include "identity/Identity.h"
#include "identity/linux/Files.h"

namespace assay_host {

// The variables of an environment.
using Variables = std::map<std::string, std::string>;

// Collects the adapters, the system and the driver files of the machine whose files these are, for
// a process with this environment. The version of assay is left empty. Throws only std::bad_alloc.
// Any thread may call.
Identity GetMachineIdentity(const Files& files, const Variables& environment);

} // namespace assay_host
