// What the platform's part of watching for interrupts hands to the neutral one.
#pragma once

#include <memory>

#include "supervise/StopRequest.h"

namespace assay_host {

// Which request a wish raises.
void SetInterruptStop(std::shared_ptr<StopRequest> stop);

// A wish was seen. Any thread may call, but no signal handler.
void NoteInterrupt();

} // namespace assay_host
