// Display devices and offscreen contexts on EGL.
//
// The devices are those of EGL's device enumeration. Without that extension there is one device:
// the surfaceless platform if EGL has it, else the default display.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "qgf/OGLPlatform.h"
#include "qgf/qgf_ogl/linux/EGLTable.h"

namespace QGF {
namespace OGL {

class EGLPlatform : public Platform {
public:
    // The functions that look adapters up; tests replace them.
    struct AdapterLookup {
        // AdapterOfDrmNode of qgf/DrmNodes.h.
        std::string (*addressOfNode)(const std::string& node);
        // NvidiaAdapters of qgf/AdapterName.h.
        std::vector<std::string> (*addressesOfNvidia)(const std::vector<std::string>& names,
                                                      const std::vector<std::string>& taken);
        // AdapterName of qgf/AdapterName.h.
        std::string (*nameOfAddress)(const std::string& address);
        // IsFirmwareNode of qgf/DrmNodes.h.
        bool (*isFirmwareNode)(const std::string& node);
    };

    EGLPlatform(const EGLTable& egl, const AdapterLookup& lookup) : fEGL(egl), fLookup(lookup) {}

    std::vector<DisplayDeviceKey> displayDevices() override;
    std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) override;

private:
    // An initialised display and its extensions.
    struct Display {
        EGLDisplay handle;
        bool surfaceless;
        bool configless;
        bool contextAttributes;
    };

    // One way to reach a display device.
    struct Route {
        EGLenum platform; // EGL_NONE: the default display
        EGLDeviceEXT device;
    };

    // A display device and its EGL devices: two drivers may list the same adapter.
    struct Device {
        DisplayDeviceKey key;
        std::vector<Route> routes;
    };

    // A device of EGL's list.
    struct EGLDevice {
        EGLDeviceEXT handle;
        int position;
        bool software;
        bool nvidia;
        std::string node;     // "" if it has none
        std::string renderer; // EGL_RENDERER_EXT; "" if it has none
        std::string address;  // the adapter's place; "" if unknown
        bool firmware;        // it renders to the firmware's framebuffer
    };

    void FindDevices();
    void FindEGLDevices();
    void AddEGLDevice(const EGLDevice& device);
    std::vector<EGLDevice> ListEGLDevices() const;
    EGLDevice DescribeEGLDevice(EGLDeviceEXT device, int position) const;
    void FindNvidiaAddresses(std::vector<EGLDevice>& devices) const;
    void AddOnlyDevice(EGLenum platform);
    std::string QueryDeviceString(EGLDeviceEXT device, EGLint name) const;
    const Display& OpenDisplay(const Route& route, const std::string& name);
    std::unique_ptr<PlatformContext> CreateContext(const Display& display, const std::string& name);
    EGLConfig ChooseConfig(const Display& display, const std::string& name) const;

    const EGLTable fEGL;
    const AdapterLookup fLookup;
    std::vector<Device> fDevices;
    // Displays stay initialised until the process ends: terminating one destroys all its contexts.
    std::map<std::pair<EGLenum, EGLDeviceEXT>, Display> fDisplays;
};

} // namespace OGL
} // namespace QGF
