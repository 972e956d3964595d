// What the running system says of itself.
#pragma once

#include "report/RunFacts.h"

namespace assay_host {

// Reads the system's own descriptions, and the clock. The machine's name is read only with
// `identify`: documents are passed on. Never throws for what the system does not tell; that is
// unknown then. Any thread may call.
Environment GetEnvironment(bool identify);

} // namespace assay_host
