// The system's error dialogs.
#pragma once

namespace assay_host {

// Disables the dialogs of Windows for a crash, a missing library or an empty drive, in this process
// and in children that start later. Does nothing on Linux. Call at the start of the process.
void KeepDialogsAway();

} // namespace assay_host
