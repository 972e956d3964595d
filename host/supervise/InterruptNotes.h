// The interface from the platforms' code of interrupts to the neutral code.
#pragma once

#include <memory>

#include "pmutil/StopRequest.h"

namespace assay_host {

// Sets the request that an interrupt raises. Any thread may call.
void SetInterruptStop(std::shared_ptr<pmutil::StopRequest> stop);

// Reports an interrupt. Any thread may call; a signal handler must not.
void NoteInterrupt();

} // namespace assay_host
