// The platform interface below QGF::OGL: display devices, offscreen contexts and entry-point
// look-up. Tests replace it by a fake.
#pragma once

#include <memory>
#include <vector>

#include "qgf/OGL.h"

namespace QGF {
namespace OGL {

// One native context. The destructor destroys it and its window or surface.
class PlatformContext {
public:
    virtual ~PlatformContext() = default;
    // Makes it current on the calling thread. Throws LogicalException.
    virtual void makeCurrent() = 0;
    // Leaves no context current on the calling thread. Never throws.
    virtual void release() noexcept = 0;
    // Returns the entry point, null if the driver has none of that name. Called while this context
    // is current.
    virtual Core::Proc getProc(const char* name) = 0;
};

class Platform {
public:
    virtual ~Platform() = default;

    // Lists the display devices, hardware before software. The first is the primary device. The
    // list is cached after the first successful call.
    virtual std::vector<DisplayDeviceKey> displayDevices() = 0;

    // Makes a compatibility context on one of those devices. Throws LogicalException.
    virtual std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) = 0;
};

// Makes the native platform. Throws LogicalException if the system has no OpenGL binding. Each
// platform has its own source file for it.
std::unique_ptr<Platform> MakeNativePlatform();

// Replaces the native platform and drops the cached list of devices; null restores the native
// platform. For tests; no context may be alive.
void ReplacePlatform(std::unique_ptr<Platform> platform);

} // namespace OGL
} // namespace QGF
