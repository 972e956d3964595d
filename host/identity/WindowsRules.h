// Derives the identity of a Windows machine from its registry.
#pragma once

#include "identity/WindowsSource.h"

namespace assay_host {

// Returns the adapters and the driver files: the loader libraries, and the drivers that the display
// devices, their software components and the lists for OpenCL and OpenGL name. The libraries that
// these need aren't listed. Throws only std::bad_alloc.
Identity GetWindowsIdentity(WindowsSource& source);

} // namespace assay_host
