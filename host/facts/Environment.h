// Collects facts about the running system.
#pragma once

#include "report/RunFacts.h"

namespace assay_host {

// Reads the system's descriptions and the clock. The machine's name is read only with `identify`,
// since documents are passed on to others. A fact that the system doesn't provide is unknown, and
// nothing is thrown for it. Any thread may call.
Environment GetEnvironment(bool identify);

} // namespace assay_host
