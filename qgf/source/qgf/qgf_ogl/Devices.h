// The current platform and its display devices.
#pragma once

#include <vector>

#include "qgf/OGLPlatform.h"

namespace QGF {
namespace OGL {

// Returns the platform set by ReplacePlatform, else the native one, which the first call makes.
// Throws LogicalException if there is none.
Platform& CurrentPlatform();

// Returns the platform's display devices. The list is cached after the first success. Throws what
// the platform throws.
const std::vector<DisplayDeviceKey>& DisplayDevices();

} // namespace OGL
} // namespace QGF
