// The start of the OpenCL half of the sequence.
#pragma once

#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace assay {

// Stores in `available` what isAvailable() answers, and calls initialize() if that is true.
// Whatever one of them throws ends here without a word, and leaves `available` as it is: a library
// that doesn't start shows by what the OpenCL half finds.
template <typename IsAvailable, typename Initialize>
void StartOpenCL(bool& available, const IsAvailable& isAvailable, const Initialize& initialize)
{
    try {
        available = isAvailable();
        if (available) {
            PM_LOG(pmutil::gGPUAssay, "DoRunQGFOCLInitialize: QGF::OCL::Library::initialize();");
            initialize();
        }
    } catch (...) {
        // As told above.
    }
}

} // namespace assay
