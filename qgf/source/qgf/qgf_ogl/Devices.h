// The platform binding of the process and the display devices that it knows.
#pragma once

#include <vector>

#include "qgf/OGLPlatform.h"

namespace QGF {
namespace OGL {

// The replaced platform, else the native one, made at the first call. Throws if there is none.
Platform& CurrentPlatform();

// Asked of the platform once; again only after a failure. Throws what the platform throws.
const std::vector<DisplayDeviceKey>& DisplayDevices();

} // namespace OGL
} // namespace QGF
