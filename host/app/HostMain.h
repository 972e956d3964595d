// assay-host from its arguments to its exit status.
#pragma once

namespace assay_host {

// The whole of main. Call it once in a process.
int RunHost(int argc, char** argv);

} // namespace assay_host
