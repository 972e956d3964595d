// Display devices and offscreen contexts by EGL.
//
// Devices come from EGL's device enumeration; without that, the surfaceless platform, else the
// default display, is the only device.
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
    // How the addresses of adapters are found; replaceable for tests.
    struct AdapterLookup {
        // The place (qgf/DrmNodes.h) of the adapter behind a DRM node such as "/dev/dri/card0"; ""
        // if unknown.
        std::string (*addressOfNode)(const std::string& node);
        // The PCI addresses of NVIDIA devices that no DRM node leads to, in their order; "" where
        // unknown.
        // `names` are the names that the devices give themselves, "" for none, `taken` the
        // addresses that other devices have.
        std::vector<std::string> (*addressesOfNvidia)(const std::vector<std::string>& names,
                                                      const std::vector<std::string>& taken);
        // The adapter's name by its place; "" if unknown.
        std::string (*nameOfAddress)(const std::string& address);
        // Whether a DRM node is the firmware's framebuffer on an adapter, which no driver of the
        // adapter renders to.
        bool (*isFirmwareNode)(const std::string& node);
    };

    EGLPlatform(const EGLTable& egl, const AdapterLookup& lookup) : fEGL(egl), fLookup(lookup) {}

    std::vector<DisplayDeviceKey> displayDevices() override;
    std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) override;

private:
    // An initialised display and what it offers.
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

    // The EGL devices of one display device: two drivers may offer the same adapter.
    struct Device {
        DisplayDeviceKey key;
        std::vector<Route> routes;
    };

    // What EGL says about a device of its list.
    struct EGLDevice {
        EGLDeviceEXT handle;
        int position;
        bool software;
        bool nvidia;
        std::string node;     // "" if it has none
        std::string renderer; // "" if it doesn't say
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
    // Displays stay initialised to the end of the process: EGL ends all contexts of one at once.
    std::map<std::pair<EGLenum, EGLDeviceEXT>, Display> fDisplays;
};

} // namespace OGL
} // namespace QGF
