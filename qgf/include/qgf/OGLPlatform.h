// The seam below QGF::OGL: display devices, offscreen contexts and entry-point look-up, as a
// platform supplies them. Tests put a fake one in its place.
#pragma once

#include <memory>
#include <vector>

#include "qgf/OGL.h"

namespace QGF {
namespace OGL {

// One native context. Destroying it releases it, and what was made for it.
class PlatformContext {
public:
    virtual ~PlatformContext() = default;
    // Makes it current on the calling thread. Throws LogicalException.
    virtual void makeCurrent() = 0;
    // Leaves no context current on the calling thread. Never throws.
    virtual void release() noexcept = 0;
    // Null if the driver has no such entry point. Called while this context is current.
    virtual Core::Proc getProc(const char* name) = 0;
};

class Platform {
public:
    virtual ~Platform() = default;

    // The display devices in their order: hardware before software. The first one is the primary.
    // Asked once, at the first question about devices.
    virtual std::vector<DisplayDeviceKey> displayDevices() = 0;

    // A compatibility context on one of those devices. Throws LogicalException.
    virtual std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) = 0;
};

// Makes the platform's own binding. Throws LogicalException if there is none. One twin source per
// platform implements it.
std::unique_ptr<Platform> MakeNativePlatform();

// Puts `platform` in the place of the native one and forgets what was known of devices; null
// brings the native one back. For tests; no context may be alive.
void ReplacePlatform(std::unique_ptr<Platform> platform);

} // namespace OGL
} // namespace QGF
