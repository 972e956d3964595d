// The start of the OpenCL half of the sequence.
#pragma once

#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace assay {

// Sets `available` to isAvailable() and, if that is true, calls initialize(). Exceptions of both
// are ignored silently. If initialize() throws, `available` stays true: the enumeration of the
// OpenCL half then shows the failure.
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
        // Ignored, as described above.
    }
}

} // namespace assay
