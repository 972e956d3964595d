// What the platform's code reports to the neutral code about interrupts.
#pragma once

#include <memory>

#include "supervise/StopRequest.h"

namespace assay_host {

// The request that an interrupt raises.
void SetInterruptStop(std::shared_ptr<StopRequest> stop);

// Reports an interrupt. Any thread may call, but no signal handler.
void NoteInterrupt();

} // namespace assay_host
