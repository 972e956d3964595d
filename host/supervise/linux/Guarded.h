// Whether this process's guardian is alive.
#pragma once

namespace assay_host {

// False once the guardian has ended; true without a guardian. Any thread may call.
bool IsGuarded();

} // namespace assay_host
