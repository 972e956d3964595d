// Turns the options of the command advise into the request of the adviser.
#pragma once

#include "app/CommandLine.h"
#include "memory/Adviser.h"

namespace assay_host {

// Times above 100 years become 100 years.
AdviceRequest MakeAdviceRequest(const AdviseChoice& choice);

} // namespace assay_host
