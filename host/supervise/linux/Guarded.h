// Whether this process's guardian is there.
#pragma once

namespace assay_host {

// False once the guardian has ended; true without one. Any thread may ask.
bool IsGuarded();

} // namespace assay_host
