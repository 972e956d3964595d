#include "qgf/qgf_ogl/linux/EGLPlatform.h"

#include <algorithm>
#include <cstdio>
#include <iterator>
#include <string_view>
#include <utility>

#include "qgf/AdapterName.h"
#include "qgf/DriverCall.h"
#include "qgf/DrmNodes.h"
#include "qgf/qgf_core/Quietly.h"

namespace QGF {
namespace OGL {

namespace {

// No machine has a tenth as many. A larger number isn't a count of devices.
constexpr EGLint kMaxDevices = 4096;

// Pixels. Nothing is drawn on the surface.
constexpr EGLint kPbufferSize = 32;

struct ErrorName {
    EGLint error;
    const char* name;
};

constexpr ErrorName kErrorNames[] = {
    {EGL_SUCCESS, "EGL_SUCCESS"},
    {EGL_NOT_INITIALIZED, "EGL_NOT_INITIALIZED"},
    {EGL_BAD_ACCESS, "EGL_BAD_ACCESS"},
    {EGL_BAD_ALLOC, "EGL_BAD_ALLOC"},
    {EGL_BAD_ATTRIBUTE, "EGL_BAD_ATTRIBUTE"},
    {EGL_BAD_CONFIG, "EGL_BAD_CONFIG"},
    {EGL_BAD_CONTEXT, "EGL_BAD_CONTEXT"},
    {EGL_BAD_CURRENT_SURFACE, "EGL_BAD_CURRENT_SURFACE"},
    {EGL_BAD_DISPLAY, "EGL_BAD_DISPLAY"},
    {EGL_BAD_MATCH, "EGL_BAD_MATCH"},
    {EGL_BAD_NATIVE_PIXMAP, "EGL_BAD_NATIVE_PIXMAP"},
    {EGL_BAD_NATIVE_WINDOW, "EGL_BAD_NATIVE_WINDOW"},
    {EGL_BAD_PARAMETER, "EGL_BAD_PARAMETER"},
    {EGL_BAD_SURFACE, "EGL_BAD_SURFACE"},
    {EGL_CONTEXT_LOST, "EGL_CONTEXT_LOST"},
    {EGL_BAD_DEVICE_EXT, "EGL_BAD_DEVICE_EXT"},
};

std::string ErrorText(EGLint error)
{
    char number[16];
    std::snprintf(number, sizeof number, "0x%04X", static_cast<unsigned>(error));
    const auto* const row =
        std::find_if(std::begin(kErrorNames), std::end(kErrorNames),
                     [error](const ErrorName& candidate) { return candidate.error == error; });
    return row != std::end(kErrorNames) ? std::string(row->name) + " (" + number + ")" : number;
}

// Calls eglGetError, so it must directly follow the failed call. `device` may be empty.
[[noreturn]] void ThrowFailed(const EGLTable& egl, const char* call, const std::string& device)
{
    throw LogicalException(std::string(call) + " failed" +
                           (device.empty() ? "" : " for display device " + device) + ": " +
                           ErrorText(egl.eglGetError()));
}

std::string Text(const char* text)
{
    return text != nullptr ? text : "";
}

bool HasWord(std::string_view list, std::string_view word)
{
    while (!list.empty()) {
        const std::size_t end = list.find(' ');
        if (list.substr(0, end) == word)
            return true;
        list = end == std::string_view::npos ? std::string_view() : list.substr(end + 1);
    }
    return false;
}

class EGLOffscreen : public PlatformContext {
public:
    EGLOffscreen(const EGLTable& egl, EGLDisplay display, EGLContext context, std::string device)
        : fEGL(egl), fDisplay(display), fContext(context), fDevice(std::move(device))
    {}

    ~EGLOffscreen() override
    {
        Core::Quietly([this] {
            if (fSurface != EGL_NO_SURFACE)
                fEGL.eglDestroySurface(fDisplay, fSurface);
        });
        Core::Quietly([this] { fEGL.eglDestroyContext(fDisplay, fContext); });
    }

    EGLOffscreen(const EGLOffscreen&) = delete;
    EGLOffscreen& operator=(const EGLOffscreen&) = delete;

    void createSurface(EGLConfig config)
    {
        const EGLint attributes[] = {EGL_WIDTH, kPbufferSize, EGL_HEIGHT, kPbufferSize, EGL_NONE};
        fSurface = fEGL.eglCreatePbufferSurface(fDisplay, config, attributes);
        if (fSurface == EGL_NO_SURFACE)
            ThrowFailed(fEGL, "eglCreatePbufferSurface", fDevice);
    }

    void makeCurrent() override
    {
        // The API is bound per thread, and this may be another thread than that of the constructor.
        if (fEGL.eglBindAPI(EGL_OPENGL_API) == EGL_FALSE)
            ThrowFailed(fEGL, "eglBindAPI", fDevice);
        if (fEGL.eglMakeCurrent(fDisplay, fSurface, fSurface, fContext) == EGL_FALSE)
            ThrowFailed(fEGL, "eglMakeCurrent", fDevice);
    }

    void release() noexcept override
    {
        Core::Quietly([this] {
            fEGL.eglMakeCurrent(fDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
        });
    }

    Core::Proc getProc(const char* name) override { return fEGL.eglGetProcAddress(name); }

private:
    const EGLTable& fEGL;
    EGLDisplay fDisplay;
    EGLContext fContext;
    EGLSurface fSurface = EGL_NO_SURFACE;
    std::string fDevice;
};

} // namespace

std::string EGLPlatform::QueryDeviceString(EGLDeviceEXT device, EGLint name) const
{
    return Text(fEGL.eglQueryDeviceStringEXT(device, name));
}

std::vector<DisplayDeviceKey> EGLPlatform::displayDevices()
{
    FindDevices();
    std::vector<DisplayDeviceKey> keys;
    keys.reserve(fDevices.size());
    for (const Device& device : fDevices)
        keys.push_back(device.key);
    return keys;
}

void EGLPlatform::FindDevices()
{
    fDevices.clear();
    // Without client extensions EGL returns null and raises an error, which is ignored.
    const std::string extensions = Text(fEGL.eglQueryString(EGL_NO_DISPLAY, EGL_EXTENSIONS));
    const bool base = HasWord(extensions, "EGL_EXT_device_base");
    const bool enumeration = base || HasWord(extensions, "EGL_EXT_device_enumeration");
    const bool query = base || HasWord(extensions, "EGL_EXT_device_query");
    const bool platforms = fEGL.eglGetPlatformDisplayEXT != nullptr;

    if (platforms && enumeration && query && HasWord(extensions, "EGL_EXT_platform_device") &&
        fEGL.eglQueryDevicesEXT != nullptr && fEGL.eglQueryDeviceStringEXT != nullptr)
        FindEGLDevices();
    else if (platforms && HasWord(extensions, "EGL_MESA_platform_surfaceless"))
        AddOnlyDevice(EGL_PLATFORM_SURFACELESS_MESA);
    else
        AddOnlyDevice(EGL_NONE);
}

void EGLPlatform::AddOnlyDevice(EGLenum platform)
{
    fDevices.push_back({{"egl:0", "egl:0", ""}, {{platform, nullptr}}});
}

std::vector<EGLPlatform::EGLDevice> EGLPlatform::ListEGLDevices() const
{
    EGLint count = 0;
    if (fEGL.eglQueryDevicesEXT(0, nullptr, &count) == EGL_FALSE)
        ThrowFailed(fEGL, "eglQueryDevicesEXT", "");
    if (count < 0 || count > kMaxDevices)
        throw LogicalException("eglQueryDevicesEXT reports " + std::to_string(count) + " devices");
    if (count == 0)
        return {};
    std::vector<EGLDeviceEXT> handles(static_cast<std::size_t>(count), EGL_NO_DEVICE_EXT);
    EGLint filled = 0;
    if (fEGL.eglQueryDevicesEXT(count, handles.data(), &filled) == EGL_FALSE)
        ThrowFailed(fEGL, "eglQueryDevicesEXT", "");

    std::vector<EGLDevice> devices;
    for (int i = 0; i < std::min(filled, count); ++i) {
        const EGLDeviceEXT handle = handles[static_cast<std::size_t>(i)];
        if (handle != EGL_NO_DEVICE_EXT)
            devices.push_back(DescribeEGLDevice(handle, i));
    }
    return devices;
}

EGLPlatform::EGLDevice EGLPlatform::DescribeEGLDevice(EGLDeviceEXT handle, int position) const
{
    const std::string extensions = QueryDeviceString(handle, EGL_EXTENSIONS);
    EGLDevice device{handle,
                     position,
                     HasWord(extensions, "EGL_MESA_device_software"),
                     HasWord(extensions, "EGL_NV_device_cuda"),
                     "",
                     "",
                     "",
                     false};
    // A software renderer may report an adapter's node, but it isn't that adapter.
    if (device.software)
        return device;
    if (HasWord(extensions, "EGL_EXT_device_drm"))
        device.node = QueryDeviceString(handle, EGL_DRM_DEVICE_FILE_EXT);
    if (device.node.empty() && HasWord(extensions, "EGL_EXT_device_drm_render_node"))
        device.node = QueryDeviceString(handle, EGL_DRM_RENDER_NODE_FILE_EXT);
    if (!device.node.empty()) {
        device.address = fLookup.addressOfNode(device.node);
        device.firmware = fLookup.isFirmwareNode(device.node);
    }
    if (device.address.empty() && device.nvidia && HasWord(extensions, "EGL_EXT_device_query_name"))
        device.renderer = QueryDeviceString(handle, EGL_RENDERER_EXT);
    return device;
}

void EGLPlatform::FindNvidiaAddresses(std::vector<EGLDevice>& devices) const
{
    std::vector<EGLDevice*> unknown;
    std::vector<std::string> names;
    std::vector<std::string> taken;
    for (EGLDevice& device : devices) {
        if (!device.address.empty() && !device.firmware)
            taken.push_back(device.address);
        if (device.address.empty() && device.nvidia && device.node.empty()) {
            unknown.push_back(&device);
            names.push_back(device.renderer);
        }
    }
    if (unknown.empty())
        return;
    const std::vector<std::string> addresses = fLookup.addressesOfNvidia(names, taken);
    for (std::size_t i = 0; i < std::min(unknown.size(), addresses.size()); ++i)
        unknown[i]->address = addresses[i];
}

void EGLPlatform::FindEGLDevices()
{
    std::vector<EGLDevice> devices = ListEGLDevices();
    FindNvidiaAddresses(devices);
    // If an adapter can also be reached by the firmware's framebuffer, its driver comes first.
    const auto rank = [](const EGLDevice& device) {
        return device.software ? 2 : device.firmware ? 1 : 0;
    };
    std::stable_sort(
        devices.begin(), devices.end(),
        [&](const EGLDevice& left, const EGLDevice& right) { return rank(left) < rank(right); });
    for (const EGLDevice& device : devices)
        AddEGLDevice(device);
}

void EGLPlatform::AddEGLDevice(const EGLDevice& device)
{
    const std::string name =
        device.node.empty() ? "egl:" + std::to_string(device.position) : device.node;
    const auto known = std::find_if(fDevices.begin(), fDevices.end(), [&](const Device& other) {
        return other.key.deviceName() == name ||
               (!device.address.empty() && other.key.displayID() == device.address);
    });
    const Route route = {EGL_PLATFORM_DEVICE_EXT, device.handle};
    if (known != fDevices.end()) {
        known->routes.push_back(route);
        return;
    }
    const std::string text = device.address.empty() ? "" : fLookup.nameOfAddress(device.address);
    fDevices.push_back({{name, text.empty() ? name : text, device.address}, {route}});
}

const EGLPlatform::Display& EGLPlatform::OpenDisplay(const Route& route, const std::string& name)
{
    const auto key = std::make_pair(route.platform, route.device);
    const auto known = fDisplays.find(key);
    if (known != fDisplays.end())
        return known->second;

    Display display{};
    if (route.platform == EGL_NONE) {
        display.handle = fEGL.eglGetDisplay(EGL_DEFAULT_DISPLAY);
        if (display.handle == EGL_NO_DISPLAY)
            ThrowFailed(fEGL, "eglGetDisplay", name);
    } else {
        display.handle = fEGL.eglGetPlatformDisplayEXT(route.platform, route.device, nullptr);
        if (display.handle == EGL_NO_DISPLAY)
            ThrowFailed(fEGL, "eglGetPlatformDisplayEXT", name);
    }
    EGLint major = 0;
    EGLint minor = 0;
    if (fEGL.eglInitialize(display.handle, &major, &minor) == EGL_FALSE)
        ThrowFailed(fEGL, "eglInitialize", name);

    const std::string extensions = Text(fEGL.eglQueryString(display.handle, EGL_EXTENSIONS));
    display.surfaceless = HasWord(extensions, "EGL_KHR_surfaceless_context");
    display.configless = HasWord(extensions, "EGL_KHR_no_config_context");
    display.contextAttributes =
        major > 1 || (major == 1 && minor >= 5) || HasWord(extensions, "EGL_KHR_create_context");
    return fDisplays.emplace(key, display).first->second;
}

EGLConfig EGLPlatform::ChooseConfig(const Display& display, const std::string& name) const
{
    // The preferred configuration, else any that OpenGL can use.
    const EGLint surface = display.surfaceless ? 0 : EGL_PBUFFER_BIT;
    const EGLint preferred[] = {EGL_SURFACE_TYPE, surface, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT,
                                EGL_RED_SIZE,     8,       EGL_GREEN_SIZE,      8,
                                EGL_BLUE_SIZE,    8,       EGL_ALPHA_SIZE,      8,
                                EGL_NONE};
    const EGLint minimal[] = {EGL_SURFACE_TYPE, surface, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT,
                              EGL_NONE};
    for (const EGLint* const attributes : {preferred, minimal}) {
        EGLConfig config = nullptr;
        EGLint count = 0;
        if (fEGL.eglChooseConfig(display.handle, attributes, &config, 1, &count) == EGL_FALSE)
            ThrowFailed(fEGL, "eglChooseConfig", name);
        if (count > 0)
            return config;
    }
    throw LogicalException("eglChooseConfig finds no OpenGL configuration for display device " +
                           name);
}

std::unique_ptr<PlatformContext> EGLPlatform::CreateContext(const Display& display,
                                                            const std::string& name)
{
    if (fEGL.eglBindAPI(EGL_OPENGL_API) == EGL_FALSE)
        ThrowFailed(fEGL, "eglBindAPI", name);

    // Without attributes EGL makes a context of the newest version that is compatible with 1.0,
    // which is a compatibility context. Some implementations require the attributes.
    const EGLint plain[] = {EGL_NONE};
    const EGLint compatible[] = {EGL_CONTEXT_MAJOR_VERSION_KHR,
                                 3,
                                 EGL_CONTEXT_MINOR_VERSION_KHR,
                                 2,
                                 EGL_CONTEXT_OPENGL_PROFILE_MASK_KHR,
                                 EGL_CONTEXT_OPENGL_COMPATIBILITY_PROFILE_BIT_KHR,
                                 EGL_NONE};
    const auto create = [&](EGLConfig config) {
        EGLContext context = fEGL.eglCreateContext(display.handle, config, EGL_NO_CONTEXT, plain);
        if (context == EGL_NO_CONTEXT && display.contextAttributes)
            context = fEGL.eglCreateContext(display.handle, config, EGL_NO_CONTEXT, compatible);
        return context;
    };

    EGLConfig config = nullptr;
    EGLContext context = EGL_NO_CONTEXT;
    if (display.surfaceless && display.configless)
        context = create(EGL_NO_CONFIG_KHR);
    if (context == EGL_NO_CONTEXT) {
        config = ChooseConfig(display, name);
        context = create(config);
    }
    if (context == EGL_NO_CONTEXT)
        ThrowFailed(fEGL, "eglCreateContext", name);

    auto offscreen = std::make_unique<EGLOffscreen>(fEGL, display.handle, context, name);
    if (!display.surfaceless)
        offscreen->createSurface(config);
    return offscreen;
}

std::unique_ptr<PlatformContext> EGLPlatform::createOffscreen(const DisplayDeviceKey& key)
{
    if (fDevices.empty())
        FindDevices();
    const std::string& name = key.deviceName();
    const auto device = std::find_if(fDevices.begin(), fDevices.end(), [&](const Device& other) {
        return other.key.deviceName() == name;
    });
    if (device == fDevices.end())
        throw LogicalException("Unknown display device \"" + name + "\"");

    std::string reasons;
    for (const Route& route : device->routes) {
        try {
            return CreateContext(OpenDisplay(route, name), name);
        } catch (const LogicalException& exception) {
            if (!reasons.empty())
                reasons += "; ";
            reasons += exception.what();
        }
    }
    throw LogicalException(reasons);
}

std::unique_ptr<Platform> MakeNativePlatform()
{
    // Never closed: drivers have threads and exit handlers.
    static const char* const names[] = {"libEGL.so.1", "libEGL.so", nullptr};
    static Core::DynamicLibrary* const library = [] {
        const Core::DriverCall call(Core::Interface::kOpenGL);
        return Core::OpenLibrary(names).release();
    }();
    EGLTable egl;
    FillEGLTable(
        egl,
        [](void* context, const char* name) {
            return static_cast<Core::DynamicLibrary*>(context)->getProc(name);
        },
        library);
    if (Core::IsObserved())
        ObserveCalls(egl);
    return std::make_unique<EGLPlatform>(
        egl,
        EGLPlatform::AdapterLookup{AdapterOfDrmNode, NvidiaAdapters, AdapterName, IsFirmwareNode});
}

} // namespace OGL
} // namespace QGF
