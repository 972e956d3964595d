// The state of this process's guardian.
#pragma once

namespace assay_host {

// Returns false once the guardian has ended, and true if there is none. Any thread may call.
bool IsGuarded();

} // namespace assay_host
