// What would ask a user who isn't there.
#pragma once

namespace assay_host {

// On Windows neither this process nor a child that starts later waits in a dialog of the system's:
// after a crash, where a library is missing, before a drive without a disk. Children inherit that.
void KeepDialogsAway();

} // namespace assay_host
