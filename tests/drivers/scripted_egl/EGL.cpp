// The EGL half: devices, displays, contexts and surfaces.
#include <algorithm>
#include <cstring>
#include <memory>
#include <mutex>

#include "Driver.h"

namespace scripted {

namespace {

thread_local ContextObject* tContext = nullptr;
thread_local EGLDisplay tDisplay = nullptr;
thread_local EGLSurface tSurface = nullptr;
thread_local EGLint tError = EGL_SUCCESS;
thread_local EGLenum tAPI = EGL_OPENGL_ES_API;

// All objects that were made. They are never freed, so that handles and numbers stay unique.
struct Objects {
    std::mutex mutex;
    std::vector<std::unique_ptr<DisplayObject>> displays; // one per device
    std::vector<std::unique_ptr<ContextObject>> contexts;
    std::vector<std::unique_ptr<SurfaceObject>> surfaces;
    std::vector<const ContextObject*> deadContexts;
    char config = 0; // its address is the handle of the only configuration
};

Objects& GetObjects()
{
    static Objects* const kObjects = [] {
        auto* objects = new Objects;
        for (std::size_t i = 0; i < GetModel().devices.size(); ++i) {
            objects->displays.push_back(std::make_unique<DisplayObject>());
            objects->displays.back()->device = static_cast<int>(i);
        }
        return objects;
    }();
    return *kObjects;
}

// A device handle is the address of the model's device.
int DeviceOf(const void* handle)
{
    const std::vector<Device>& devices = GetModel().devices;
    for (std::size_t i = 0; i < devices.size(); ++i)
        if (&devices[i] == handle)
            return static_cast<int>(i);
    return -1;
}

template <typename T>
T* Find(std::vector<std::unique_ptr<T>>& all, const void* handle)
{
    const auto found = std::find_if(all.begin(), all.end(),
                                    [&](const auto& each) { return each.get() == handle; });
    return found == all.end() ? nullptr : found->get();
}

DisplayObject* DisplayOf(EGLDisplay handle)
{
    return Find(GetObjects().displays, handle);
}

ContextObject* ContextOf(EGLContext handle)
{
    Objects& objects = GetObjects();
    ContextObject* context = Find(objects.contexts, handle);
    const auto dead = std::find(objects.deadContexts.begin(), objects.deadContexts.end(), context);
    return dead == objects.deadContexts.end() ? context : nullptr;
}

int DeviceOfDisplay(EGLDisplay handle)
{
    const DisplayObject* display = DisplayOf(handle);
    return display == nullptr ? -1 : display->device;
}

Argument Named(const char* kind, std::int64_t number, bool valid)
{
    return {valid ? kind + std::to_string(number) : "none", valid ? number : -1};
}
Argument DisplayArgument(EGLDisplay handle)
{
    const int device = DeviceOfDisplay(handle);
    return Named("display", device, device >= 0);
}
Argument DeviceArgument(const void* handle)
{
    const int device = DeviceOf(handle);
    return Named("device", device, device >= 0);
}
Argument ContextArgument(EGLContext handle)
{
    const ContextObject* context = Find(GetObjects().contexts, handle);
    return Named("context", context == nullptr ? 0 : context->number, context != nullptr);
}
Argument SurfaceArgument(EGLSurface handle)
{
    const SurfaceObject* surface = Find(GetObjects().surfaces, handle);
    return Named("surface", surface == nullptr ? 0 : surface->number, surface != nullptr);
}

// The attributes as one argument: [name value ...].
template <typename T>
Argument AttributesArgument(const T* attributes)
{
    if (attributes == nullptr)
        return {"null", {}};
    std::string text = "[";
    for (; *attributes != static_cast<T>(EGL_NONE); attributes += 2) {
        text += (text.size() == 1 ? "" : " ") +
                Enum(static_cast<std::uint32_t>(attributes[0])).text + " " +
                Enum(static_cast<std::uint32_t>(attributes[1])).text;
    }
    return {text + "]", {}};
}

// A call with the effect of the rules, and EGL's error state.
struct Call {
    Effect effect;

    Call(const char* name, int device, const std::vector<Argument>& arguments,
         Result result = Result::Other)
        : effect(GetModel().monitor.Enter(name, device, arguments, result))
    {
        if (effect.claim)
            effect.returns = effect.claim;
        // eglGetError must not reset the error before it returns it.
        if (std::strcmp(name, "eglGetError") != 0)
            tError = EGL_SUCCESS;
        if (effect.error)
            tError = static_cast<EGLint>(*effect.error);
    }
    bool Over() const { return effect.error || effect.returns || effect.text != nullptr; }
    // The text that the rules return; null for none.
    const char* Text() const { return effect.text != nullptr ? effect.text->c_str() : nullptr; }
    EGLBoolean Answer() const
    {
        return effect.error ? EGL_FALSE : static_cast<EGLBoolean>(*effect.returns);
    }
};

EGLBoolean Fail(EGLint error)
{
    tError = error;
    return EGL_FALSE;
}

const char* TextOf(const Texts& texts, std::int64_t name, EGLint errorIfUnknown)
{
    const auto found = texts.find(name);
    if (found == texts.end()) {
        tError = errorIfUnknown;
        return nullptr;
    }
    return found->second ? found->second->c_str() : nullptr;
}

DisplayObject* DefaultDisplay()
{
    const auto index = static_cast<std::size_t>(GetModel().defaultDevice);
    std::vector<std::unique_ptr<DisplayObject>>& displays = GetObjects().displays;
    return index < displays.size() ? displays[index].get() : nullptr;
}

bool OffersClient(const char* extension)
{
    return HoldsWord(GetModel().clientExtensions.value_or(""), extension);
}

EGLDisplay PlatformDisplay(const Call& call, EGLenum platform, void* native)
{
    if (call.Over())
        return nullptr;
    if (platform == EGL_PLATFORM_DEVICE_EXT && OffersClient("EGL_EXT_platform_device")) {
        const int device = DeviceOf(native);
        if (device >= 0)
            return GetObjects().displays[static_cast<std::size_t>(device)].get();
    } else if (platform == EGL_PLATFORM_SURFACELESS_MESA &&
               OffersClient("EGL_MESA_platform_surfaceless")) {
        return DefaultDisplay();
    }
    Fail(EGL_BAD_PARAMETER);
    return nullptr;
}

// Returns the display if the handle is valid and the display is initialized, else null.
const DisplayObject* Ready(EGLDisplay handle)
{
    const DisplayObject* display = DisplayOf(handle);
    if (display == nullptr) {
        Fail(EGL_BAD_DISPLAY);
    } else if (!display->initialized) {
        Fail(EGL_NOT_INITIALIZED);
        display = nullptr;
    }
    return display;
}

bool OffersDisplay(const DisplayObject& display, const char* extension)
{
    const Device& device = GetModel().devices[static_cast<std::size_t>(display.device)];
    const auto list = device.displayTexts.find(EGL_EXTENSIONS);
    return list != device.displayTexts.end() && HoldsWord(list->second.value_or(""), extension);
}

EGLBoolean QueryDevices(EGLint size, EGLDeviceEXT* devices, EGLint* count)
{
    const Call call("eglQueryDevicesEXT", -1, {Number(size)}, Result::Number);
    if (call.Over()) {
        // `return N` reports N devices.
        if (call.effect.returns && count != nullptr)
            *count = static_cast<EGLint>(*call.effect.returns);
        return call.effect.error ? EGL_FALSE : EGL_TRUE;
    }
    if (count == nullptr || (devices != nullptr && size <= 0))
        return Fail(EGL_BAD_PARAMETER);
    std::vector<Device>& all = GetModel().devices;
    *count = static_cast<EGLint>(all.size());
    if (devices != nullptr) {
        *count = std::min(*count, size);
        for (EGLint i = 0; i < *count; ++i)
            devices[i] = &all[static_cast<std::size_t>(i)];
    }
    return EGL_TRUE;
}

const char* QueryDeviceString(EGLDeviceEXT handle, EGLint name)
{
    const int device = DeviceOf(handle);
    const Call call("eglQueryDeviceStringEXT", device,
                    {DeviceArgument(handle), Enum(static_cast<std::uint32_t>(name))}, Result::Text);
    if (call.Over())
        return call.Text();
    if (device < 0) {
        Fail(EGL_BAD_DEVICE_EXT);
        return nullptr;
    }
    return TextOf(GetModel().devices[static_cast<std::size_t>(device)].deviceTexts, name,
                  EGL_BAD_PARAMETER);
}

EGLBoolean QueryDeviceAttribute(EGLDeviceEXT handle, EGLint attribute, EGLAttrib* /*value*/)
{
    const Call call("eglQueryDeviceAttribEXT", DeviceOf(handle),
                    {DeviceArgument(handle), Enum(static_cast<std::uint32_t>(attribute))});
    return call.Over() ? call.Answer() : Fail(EGL_BAD_ATTRIBUTE);
}

EGLBoolean QueryDisplayAttribute(EGLDisplay handle, EGLint attribute, EGLAttrib* value)
{
    const Call call("eglQueryDisplayAttribEXT", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), Enum(static_cast<std::uint32_t>(attribute))});
    if (call.Over())
        return call.Answer();
    const DisplayObject* display = Ready(handle);
    if (display == nullptr)
        return EGL_FALSE;
    if (attribute != EGL_DEVICE_EXT)
        return Fail(EGL_BAD_ATTRIBUTE);
    // The handle as an integer.
    *value =
        reinterpret_cast<EGLAttrib>(&GetModel().devices[static_cast<std::size_t>(display->device)]);
    return EGL_TRUE;
}

EGLDisplay PlatformDisplayEXT(EGLenum platform, void* native, const EGLint* attributes)
{
    const Call call("eglGetPlatformDisplayEXT", DeviceOf(native),
                    {Enum(platform), DeviceArgument(native), AttributesArgument(attributes)});
    return PlatformDisplay(call, platform, native);
}

} // namespace

ContextObject* CurrentContext()
{
    return tContext;
}

} // namespace scripted

using namespace scripted; // NOLINT(google-build-using-namespace): the C entry points lie outside

extern "C" {

EGLAPI EGLint EGLAPIENTRY eglGetError(void)
{
    const Call call("eglGetError", -1, {});
    const EGLint error = call.effect.returns ? static_cast<EGLint>(*call.effect.returns) : tError;
    tError = EGL_SUCCESS;
    return error;
}

EGLAPI const char* EGLAPIENTRY eglQueryString(EGLDisplay handle, EGLint name)
{
    const Call call("eglQueryString", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), Enum(static_cast<std::uint32_t>(name))},
                    Result::Text);
    if (call.Over())
        return call.Text();
    if (handle == EGL_NO_DISPLAY) {
        if (name == EGL_EXTENSIONS && GetModel().clientExtensions)
            return GetModel().clientExtensions->c_str();
        if (name == EGL_VERSION)
            return "1.5 Scripted";
        Fail(EGL_BAD_DISPLAY);
        return nullptr;
    }
    const DisplayObject* display = Ready(handle);
    if (display == nullptr)
        return nullptr;
    return TextOf(GetModel().devices[static_cast<std::size_t>(display->device)].displayTexts, name,
                  EGL_BAD_PARAMETER);
}

EGLAPI EGLDisplay EGLAPIENTRY eglGetDisplay(EGLNativeDisplayType /*native*/)
{
    const Call call("eglGetDisplay", -1, {});
    return call.Over() ? nullptr : DefaultDisplay();
}

EGLAPI EGLDisplay EGLAPIENTRY eglGetPlatformDisplay(EGLenum platform, void* native,
                                                    const EGLAttrib* attributes)
{
    const Call call("eglGetPlatformDisplay", DeviceOf(native),
                    {Enum(platform), DeviceArgument(native), AttributesArgument(attributes)});
    return PlatformDisplay(call, platform, native);
}

EGLAPI EGLBoolean EGLAPIENTRY eglInitialize(EGLDisplay handle, EGLint* major, EGLint* minor)
{
    const Call call("eglInitialize", DeviceOfDisplay(handle), {DisplayArgument(handle)});
    if (call.Over())
        return call.Answer();
    DisplayObject* display = DisplayOf(handle);
    if (display == nullptr)
        return Fail(EGL_BAD_DISPLAY);
    display->initialized = true;
    if (major != nullptr)
        *major = GetModel().eglMajor;
    if (minor != nullptr)
        *minor = GetModel().eglMinor;
    return EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglTerminate(EGLDisplay handle)
{
    const Call call("eglTerminate", DeviceOfDisplay(handle), {DisplayArgument(handle)});
    if (call.Over())
        return call.Answer();
    DisplayObject* display = DisplayOf(handle);
    if (display == nullptr)
        return Fail(EGL_BAD_DISPLAY);
    display->initialized = false;
    return EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglBindAPI(EGLenum api)
{
    const Call call("eglBindAPI", -1, {Enum(api)});
    if (call.Over())
        return call.Answer();
    if (api != EGL_OPENGL_API && api != EGL_OPENGL_ES_API)
        return Fail(EGL_BAD_PARAMETER);
    tAPI = api;
    return EGL_TRUE;
}

EGLAPI EGLenum EGLAPIENTRY eglQueryAPI(void)
{
    const Call call("eglQueryAPI", -1, {});
    return tAPI;
}

EGLAPI EGLBoolean EGLAPIENTRY eglGetConfigs(EGLDisplay handle, EGLConfig* configs, EGLint size,
                                            EGLint* count)
{
    const Call call("eglGetConfigs", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), Number(size)});
    if (call.Over())
        return call.Answer();
    if (Ready(handle) == nullptr)
        return EGL_FALSE;
    *count = 1;
    if (configs != nullptr && size > 0)
        configs[0] = &GetObjects().config;
    return EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglChooseConfig(EGLDisplay handle, const EGLint* attributes,
                                              EGLConfig* configs, EGLint size, EGLint* count)
{
    const Call call("eglChooseConfig", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), AttributesArgument(attributes), Number(size)},
                    Result::Number);
    if (call.Over()) {
        // `return N` reports N configurations and returns none.
        if (call.effect.returns && count != nullptr)
            *count = static_cast<EGLint>(*call.effect.returns);
        return call.effect.error ? EGL_FALSE : EGL_TRUE;
    }
    if (Ready(handle) == nullptr)
        return EGL_FALSE;
    *count = 1;
    if (configs != nullptr && size > 0)
        configs[0] = &GetObjects().config;
    return EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglGetConfigAttrib(EGLDisplay handle, EGLConfig /*config*/,
                                                 EGLint attribute, EGLint* value)
{
    const Call call("eglGetConfigAttrib", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), Enum(static_cast<std::uint32_t>(attribute))});
    if (call.Over())
        return call.Answer();
    if (Ready(handle) == nullptr)
        return EGL_FALSE;
    static const std::map<EGLint, EGLint> kAttributes = {
        {EGL_RED_SIZE, 8},
        {EGL_GREEN_SIZE, 8},
        {EGL_BLUE_SIZE, 8},
        {EGL_ALPHA_SIZE, 8},
        {EGL_BUFFER_SIZE, 32},
        {EGL_CONFIG_ID, 1},
        {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT},
        {EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT | EGL_OPENGL_ES2_BIT}};
    const auto found = kAttributes.find(attribute);
    *value = found == kAttributes.end() ? 0 : found->second;
    return EGL_TRUE;
}

EGLAPI EGLContext EGLAPIENTRY eglCreateContext(EGLDisplay handle, EGLConfig config,
                                               EGLContext share, const EGLint* attributes)
{
    const Call call("eglCreateContext", DeviceOfDisplay(handle),
                    {DisplayArgument(handle),
                     {config == nullptr ? "none" : "config", {}},
                     ContextArgument(share),
                     AttributesArgument(attributes)});
    if (call.Over())
        return EGL_NO_CONTEXT;
    const DisplayObject* display = Ready(handle);
    if (display == nullptr)
        return EGL_NO_CONTEXT;
    if (config == nullptr && !OffersDisplay(*display, "EGL_KHR_no_config_context")) {
        Fail(EGL_BAD_CONFIG);
        return EGL_NO_CONTEXT;
    }
    // This driver has no OpenGL ES.
    if (tAPI != EGL_OPENGL_API) {
        Fail(EGL_BAD_MATCH);
        return EGL_NO_CONTEXT;
    }
    Objects& objects = GetObjects();
    const std::lock_guard<std::mutex> lock(objects.mutex);
    objects.contexts.push_back(std::make_unique<ContextObject>());
    objects.contexts.back()->device = display->device;
    objects.contexts.back()->number = static_cast<int>(objects.contexts.size());
    return objects.contexts.back().get();
}

EGLAPI EGLBoolean EGLAPIENTRY eglDestroyContext(EGLDisplay handle, EGLContext context)
{
    const Call call("eglDestroyContext", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), ContextArgument(context)});
    if (call.Over())
        return call.Answer();
    const ContextObject* object = ContextOf(context);
    if (object == nullptr)
        return Fail(EGL_BAD_CONTEXT);
    Objects& objects = GetObjects();
    const std::lock_guard<std::mutex> lock(objects.mutex);
    objects.deadContexts.push_back(object);
    return EGL_TRUE;
}

EGLAPI EGLSurface EGLAPIENTRY eglCreatePbufferSurface(EGLDisplay handle, EGLConfig /*config*/,
                                                      const EGLint* attributes)
{
    const Call call("eglCreatePbufferSurface", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), AttributesArgument(attributes)});
    const DisplayObject* display = call.Over() ? nullptr : Ready(handle);
    if (display == nullptr)
        return EGL_NO_SURFACE;
    Objects& objects = GetObjects();
    const std::lock_guard<std::mutex> lock(objects.mutex);
    objects.surfaces.push_back(std::make_unique<SurfaceObject>());
    objects.surfaces.back()->device = display->device;
    objects.surfaces.back()->number = static_cast<int>(objects.surfaces.size());
    return objects.surfaces.back().get();
}

// This driver has no windows.
EGLAPI EGLSurface EGLAPIENTRY eglCreateWindowSurface(EGLDisplay handle, EGLConfig /*config*/,
                                                     EGLNativeWindowType /*window*/,
                                                     const EGLint* attributes)
{
    const Call call("eglCreateWindowSurface", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), AttributesArgument(attributes)});
    if (!call.Over() && Ready(handle) != nullptr)
        Fail(EGL_BAD_NATIVE_WINDOW);
    return EGL_NO_SURFACE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglDestroySurface(EGLDisplay handle, EGLSurface surface)
{
    const Call call("eglDestroySurface", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), SurfaceArgument(surface)});
    if (call.Over())
        return call.Answer();
    return Find(GetObjects().surfaces, surface) == nullptr ? Fail(EGL_BAD_SURFACE) : EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglMakeCurrent(EGLDisplay handle, EGLSurface draw, EGLSurface read,
                                             EGLContext context)
{
    const Call call("eglMakeCurrent", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), SurfaceArgument(draw), SurfaceArgument(read),
                     ContextArgument(context)});
    if (call.Over())
        return call.Answer();
    const DisplayObject* display = Ready(handle);
    if (display == nullptr)
        return EGL_FALSE;
    if (context == EGL_NO_CONTEXT) {
        tContext = nullptr;
        tDisplay = nullptr;
        tSurface = nullptr;
        return EGL_TRUE;
    }
    ContextObject* object = ContextOf(context);
    if (object == nullptr)
        return Fail(EGL_BAD_CONTEXT);
    if (object->device != display->device ||
        (draw == EGL_NO_SURFACE && !OffersDisplay(*display, "EGL_KHR_surfaceless_context")))
        return Fail(EGL_BAD_MATCH);
    tContext = object;
    tDisplay = handle;
    tSurface = draw;
    return EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglSwapBuffers(EGLDisplay handle, EGLSurface surface)
{
    const Call call("eglSwapBuffers", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), SurfaceArgument(surface)});
    if (call.Over())
        return call.Answer();
    return Find(GetObjects().surfaces, surface) == nullptr ? Fail(EGL_BAD_SURFACE) : EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglSwapInterval(EGLDisplay handle, EGLint interval)
{
    const Call call("eglSwapInterval", DeviceOfDisplay(handle),
                    {DisplayArgument(handle), Number(interval)});
    return call.Over() ? call.Answer() : EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglWaitGL(void)
{
    const Call call("eglWaitGL", tContext == nullptr ? -1 : tContext->device, {});
    return call.Over() ? call.Answer() : EGL_TRUE;
}

EGLAPI EGLBoolean EGLAPIENTRY eglWaitNative(EGLint engine)
{
    const Call call("eglWaitNative", tContext == nullptr ? -1 : tContext->device,
                    {Enum(static_cast<std::uint32_t>(engine))});
    return call.Over() ? call.Answer() : EGL_TRUE;
}

EGLAPI EGLContext EGLAPIENTRY eglGetCurrentContext(void)
{
    const Call call("eglGetCurrentContext", tContext == nullptr ? -1 : tContext->device, {});
    return tContext;
}

EGLAPI EGLDisplay EGLAPIENTRY eglGetCurrentDisplay(void)
{
    const Call call("eglGetCurrentDisplay", tContext == nullptr ? -1 : tContext->device, {});
    return tDisplay;
}

EGLAPI EGLSurface EGLAPIENTRY eglGetCurrentSurface(EGLint which)
{
    const Call call("eglGetCurrentSurface", tContext == nullptr ? -1 : tContext->device,
                    {Enum(static_cast<std::uint32_t>(which))});
    return tSurface;
}

EGLAPI EGLBoolean EGLAPIENTRY eglReleaseThread(void)
{
    const Call call("eglReleaseThread", -1, {});
    tContext = nullptr;
    tDisplay = nullptr;
    tSurface = nullptr;
    tAPI = EGL_OPENGL_ES_API;
    return EGL_TRUE;
}

EGLAPI __eglMustCastToProperFunctionPointerType EGLAPIENTRY eglGetProcAddress(const char* name)
{
    const Call call("eglGetProcAddress", tContext == nullptr ? -1 : tContext->device, {Text(name)});
    const std::vector<std::string>& absent = GetModel().absent;
    if (call.Over() || std::find(absent.begin(), absent.end(), name) != absent.end())
        return nullptr;
    static const std::map<std::string, Entry> kEntries = {
        {"eglQueryDevicesEXT", reinterpret_cast<Entry>(&QueryDevices)},
        {"eglQueryDeviceStringEXT", reinterpret_cast<Entry>(&QueryDeviceString)},
        {"eglQueryDeviceAttribEXT", reinterpret_cast<Entry>(&QueryDeviceAttribute)},
        {"eglQueryDisplayAttribEXT", reinterpret_cast<Entry>(&QueryDisplayAttribute)},
        {"eglGetPlatformDisplayEXT", reinterpret_cast<Entry>(&PlatformDisplayEXT)},
        {"eglGetPlatformDisplay", reinterpret_cast<Entry>(&eglGetPlatformDisplay)},
        {"eglGetDisplay", reinterpret_cast<Entry>(&eglGetDisplay)},
        {"eglGetError", reinterpret_cast<Entry>(&eglGetError)},
        {"eglInitialize", reinterpret_cast<Entry>(&eglInitialize)},
        {"eglTerminate", reinterpret_cast<Entry>(&eglTerminate)},
        {"eglQueryString", reinterpret_cast<Entry>(&eglQueryString)},
        {"eglBindAPI", reinterpret_cast<Entry>(&eglBindAPI)},
        {"eglQueryAPI", reinterpret_cast<Entry>(&eglQueryAPI)},
        {"eglGetConfigs", reinterpret_cast<Entry>(&eglGetConfigs)},
        {"eglChooseConfig", reinterpret_cast<Entry>(&eglChooseConfig)},
        {"eglGetConfigAttrib", reinterpret_cast<Entry>(&eglGetConfigAttrib)},
        {"eglCreateContext", reinterpret_cast<Entry>(&eglCreateContext)},
        {"eglDestroyContext", reinterpret_cast<Entry>(&eglDestroyContext)},
        {"eglCreatePbufferSurface", reinterpret_cast<Entry>(&eglCreatePbufferSurface)},
        {"eglCreateWindowSurface", reinterpret_cast<Entry>(&eglCreateWindowSurface)},
        {"eglDestroySurface", reinterpret_cast<Entry>(&eglDestroySurface)},
        {"eglMakeCurrent", reinterpret_cast<Entry>(&eglMakeCurrent)},
        {"eglSwapBuffers", reinterpret_cast<Entry>(&eglSwapBuffers)},
        {"eglSwapInterval", reinterpret_cast<Entry>(&eglSwapInterval)},
        {"eglWaitGL", reinterpret_cast<Entry>(&eglWaitGL)},
        {"eglWaitNative", reinterpret_cast<Entry>(&eglWaitNative)},
        {"eglGetCurrentContext", reinterpret_cast<Entry>(&eglGetCurrentContext)},
        {"eglGetCurrentDisplay", reinterpret_cast<Entry>(&eglGetCurrentDisplay)},
        {"eglGetCurrentSurface", reinterpret_cast<Entry>(&eglGetCurrentSurface)},
        {"eglReleaseThread", reinterpret_cast<Entry>(&eglReleaseThread)}};
    const auto found = kEntries.find(name);
    return found == kEntries.end() ? FindGL(name) : found->second;
}

} // extern "C"
