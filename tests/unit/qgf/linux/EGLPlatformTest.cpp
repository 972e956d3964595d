// EGLPlatform on a scripted EGL table.
#include <algorithm>
#include <cstdint>
#include <functional>
#include <iterator>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/qgf_ogl/linux/EGLPlatform.h"

namespace {

using namespace QGF::OGL;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

constexpr char kAllClientExtensions[] =
    "EGL_EXT_platform_base EGL_EXT_device_base EGL_EXT_platform_device "
    "EGL_MESA_platform_surfaceless";

struct ScriptedDevice {
    std::optional<std::string> extensions;
    std::map<EGLint, std::optional<std::string>> strings;
};

// The state that the functions below return. A device's handle is its position, counted from 1.
struct Script {
    std::optional<std::string> clientExtensions = kAllClientExtensions;
    std::vector<ScriptedDevice> devices = {{"", {}}};
    std::optional<std::string> displayExtensions =
        "EGL_KHR_surfaceless_context EGL_KHR_no_config_context EGL_KHR_create_context";
    EGLint major = 1;
    EGLint minor = 5;
    std::optional<EGLint> claimedDevices;
    std::optional<EGLint> filledDevices; // what the list says that it has, if not that number
    int configs = 1;                     // the number that eglChooseConfig finds
    bool preferred = true;               // whether one of them has 8 bits per colour
    std::set<std::string> throwing;      // calls that throw through the C interface
    std::set<std::string> failing;       // calls that fail, by name or by name and first argument
    EGLint error = EGL_BAD_ALLOC;
    std::set<std::string> absent;
    std::vector<std::string> calls;
};

Script* gScript = nullptr;

template <typename Handle>
Handle AsHandle(std::size_t number)
{
    return reinterpret_cast<Handle>(number); // NOLINT(performance-no-int-to-ptr): never followed
}

std::string Number(const void* handle)
{
    return std::to_string(reinterpret_cast<std::size_t>(handle));
}

// Records the call and returns whether it succeeds.
bool Enter(const std::string& name, const std::string& arguments = "")
{
    const std::string call = arguments.empty() ? name : name + " " + arguments;
    gScript->calls.push_back(call);
    if (gScript->throwing.count(name) != 0)
        throw 1;
    return gScript->failing.count(name) == 0 && gScript->failing.count(call) == 0;
}

const char* Text(const std::optional<std::string>& text)
{
    return text ? text->c_str() : nullptr;
}

EGLint GetError()
{
    return gScript->error;
}

const char* QueryString(EGLDisplay display, EGLint name)
{
    if (name != EGL_EXTENSIONS)
        return nullptr;
    return Text(display == EGL_NO_DISPLAY ? gScript->clientExtensions : gScript->displayExtensions);
}

EGLDisplay GetDisplay(EGLNativeDisplayType)
{
    return Enter("eglGetDisplay") ? AsHandle<EGLDisplay>(100) : EGL_NO_DISPLAY;
}

EGLDisplay GetPlatformDisplay(EGLenum platform, void* native, const EGLint*)
{
    const bool surfaceless = platform == EGL_PLATFORM_SURFACELESS_MESA;
    const bool works =
        Enter("eglGetPlatformDisplayEXT", surfaceless ? "surfaceless" : "device" + Number(native));
    if (!works)
        return EGL_NO_DISPLAY;
    return surfaceless ? AsHandle<EGLDisplay>(200) : native;
}

EGLBoolean Initialize(EGLDisplay display, EGLint* major, EGLint* minor)
{
    *major = gScript->major;
    *minor = gScript->minor;
    return Enter("eglInitialize", Number(display));
}

EGLBoolean BindAPI(EGLenum api)
{
    return Enter("eglBindAPI", api == EGL_OPENGL_API ? "OpenGL" : "other");
}

bool HasPair(const EGLint* attributes, EGLint name, EGLint value)
{
    for (; *attributes != EGL_NONE; attributes += 2)
        if (attributes[0] == name && attributes[1] == value)
            return true;
    return false;
}

EGLBoolean ChooseConfig(EGLDisplay, const EGLint* attributes, EGLConfig* config, EGLint size,
                        EGLint* count)
{
    const bool preferred =
        HasPair(attributes, EGL_RED_SIZE, 8) && HasPair(attributes, EGL_GREEN_SIZE, 8) &&
        HasPair(attributes, EGL_BLUE_SIZE, 8) && HasPair(attributes, EGL_ALPHA_SIZE, 8);
    std::string text = preferred ? "8888" : "any";
    if (HasPair(attributes, EGL_SURFACE_TYPE, EGL_PBUFFER_BIT))
        text += " pbuffer";
    if (!HasPair(attributes, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT))
        text += " without OpenGL";
    if (size != 1)
        text += " of several";
    if (!Enter("eglChooseConfig", text))
        return EGL_FALSE;
    *count = preferred && !gScript->preferred ? 0 : std::min(gScript->configs, size);
    if (*count > 0)
        *config = AsHandle<EGLConfig>(preferred ? 8 : 9);
    return EGL_TRUE;
}

EGLContext CreateContext(EGLDisplay display, EGLConfig config, EGLContext, const EGLint* attributes)
{
    const bool compatibility = HasPair(attributes, EGL_CONTEXT_OPENGL_PROFILE_MASK_KHR,
                                       EGL_CONTEXT_OPENGL_COMPATIBILITY_PROFILE_BIT_KHR);
    const bool from32 = HasPair(attributes, EGL_CONTEXT_MAJOR_VERSION_KHR, 3) &&
                        HasPair(attributes, EGL_CONTEXT_MINOR_VERSION_KHR, 2);
    const std::string kind =
        compatibility ? (from32 ? "compatibility" : "compatibility of any version") : "plain";
    const bool works = Enter("eglCreateContext", kind + " config" + Number(config)) &&
                       gScript->failing.count("eglCreateContext on " + Number(display)) == 0;
    return works ? AsHandle<EGLContext>(300) : EGL_NO_CONTEXT;
}

EGLBoolean DestroyContext(EGLDisplay, EGLContext)
{
    return Enter("eglDestroyContext");
}

EGLSurface CreatePbufferSurface(EGLDisplay, EGLConfig config, const EGLint* attributes)
{
    const bool small = HasPair(attributes, EGL_WIDTH, 32) && HasPair(attributes, EGL_HEIGHT, 32);
    const std::string text = "config" + Number(config) + (small ? "" : " of another size");
    return Enter("eglCreatePbufferSurface", text) ? AsHandle<EGLSurface>(400) : EGL_NO_SURFACE;
}

EGLBoolean DestroySurface(EGLDisplay, EGLSurface)
{
    return Enter("eglDestroySurface");
}

EGLBoolean MakeCurrent(EGLDisplay, EGLSurface surface, EGLSurface, EGLContext context)
{
    return Enter("eglMakeCurrent", "context" + Number(context) + " surface" + Number(surface));
}

EGLBoolean QueryDevices(EGLint size, EGLDeviceEXT* devices, EGLint* count)
{
    const std::string text = devices == nullptr ? "count" : "list";
    if (!Enter("eglQueryDevicesEXT", size != 0 && devices == nullptr ? "list without room" : text))
        return EGL_FALSE;
    const auto known = static_cast<EGLint>(gScript->devices.size());
    *count = gScript->claimedDevices.value_or(known);
    if (devices != nullptr && gScript->filledDevices)
        *count = *gScript->filledDevices;
    if (devices != nullptr)
        for (EGLint i = 0; i < std::min(size, known); ++i)
            devices[i] = AsHandle<EGLDeviceEXT>(static_cast<std::size_t>(i) + 1);
    return EGL_TRUE;
}

const char* QueryDeviceString(EGLDeviceEXT device, EGLint name)
{
    const ScriptedDevice& script = gScript->devices[reinterpret_cast<std::size_t>(device) - 1];
    if (name == EGL_EXTENSIONS)
        return Text(script.extensions);
    const auto found = script.strings.find(name);
    if (found == script.strings.end()) {
        ADD_FAILURE() << "query of device string " << name << ", which the device lacks";
        return nullptr;
    }
    return Text(found->second);
}

void AnyFunction() {}

QGF::Core::Proc GetProcAddress(const char* name);

QGF::Core::Proc GetProc(void*, const char* name)
{
    const auto as = [](auto function) { return reinterpret_cast<QGF::Core::Proc>(function); };
    static const std::map<std::string, QGF::Core::Proc> functions = {
        {"eglGetError", as(GetError)},
        {"eglQueryString", as(QueryString)},
        {"eglGetDisplay", as(GetDisplay)},
        {"eglInitialize", as(Initialize)},
        {"eglBindAPI", as(BindAPI)},
        {"eglChooseConfig", as(ChooseConfig)},
        {"eglCreateContext", as(CreateContext)},
        {"eglDestroyContext", as(DestroyContext)},
        {"eglCreatePbufferSurface", as(CreatePbufferSurface)},
        {"eglDestroySurface", as(DestroySurface)},
        {"eglMakeCurrent", as(MakeCurrent)},
        {"eglGetProcAddress", as(GetProcAddress)},
    };
    const auto found = functions.find(name);
    const bool offered = found != functions.end() && gScript->absent.count(name) == 0;
    return offered ? found->second : nullptr;
}

QGF::Core::Proc GetProcAddress(const char* name)
{
    const auto as = [](auto function) { return reinterpret_cast<QGF::Core::Proc>(function); };
    static const std::map<std::string, QGF::Core::Proc> functions = {
        {"eglGetPlatformDisplayEXT", as(GetPlatformDisplay)},
        {"eglQueryDevicesEXT", as(QueryDevices)},
        {"eglQueryDeviceStringEXT", as(QueryDeviceString)},
        {"glClear", as(AnyFunction)},
    };
    const auto found = functions.find(name);
    const bool offered = found != functions.end() && gScript->absent.count(name) == 0;
    return offered ? found->second : nullptr;
}

std::string AddressOfNode(const std::string& node)
{
    const std::map<std::string, std::string> addresses = {{"/dev/dri/card0", "0000:01:00.0"},
                                                          {"/dev/dri/card1", "0000:02:00.0"},
                                                          {"/dev/dri/card3", "0000:02:00.0"},
                                                          {"/dev/dri/renderD128", "0000:01:00.0"}};
    const auto found = addresses.find(node);
    return found != addresses.end() ? found->second : "";
}

std::vector<std::string> AddressesOfNvidia(const std::vector<std::string>& names,
                                           const std::vector<std::string>& taken)
{
    Enter("lookup of NVIDIA");
    std::vector<std::string> addresses;
    addresses.reserve(names.size());
    for (const std::string& name : names)
        addresses.push_back(name == "Card 2" && taken.empty() ? "0000:02:00.0" : "");
    return addresses;
}

bool IsFirmwareNode(const std::string& node)
{
    return node == "/dev/dri/card3";
}

std::string NameOfAddress(const std::string& address)
{
    return address == "0000:01:00.0"   ? "First Adapter"
           : address == "0000:02:00.0" ? "Second Adapter"
                                       : "";
}

class EGLPlatformTest : public testing::Test {
public:
    EGLPlatformTest() { gScript = &script; }
    ~EGLPlatformTest() override { gScript = nullptr; }
    EGLPlatformTest(const EGLPlatformTest&) = delete;
    EGLPlatformTest& operator=(const EGLPlatformTest&) = delete;

protected:
    EGLPlatform& platform()
    {
        if (!fPlatform) {
            EGLTable table;
            FillEGLTable(table, GetProc, nullptr);
            fPlatform = std::make_unique<EGLPlatform>(
                table, EGLPlatform::AdapterLookup{AddressOfNode, AddressesOfNvidia, NameOfAddress,
                                                  IsFirmwareNode});
        }
        return *fPlatform;
    }

    // "name|string|id" of each device.
    std::vector<std::string> devices()
    {
        std::vector<std::string> texts;
        for (const DisplayDeviceKey& key : platform().displayDevices())
            texts.push_back(key.deviceName() + "|" + key.deviceString() + "|" + key.displayID());
        return texts;
    }

    std::unique_ptr<PlatformContext> create(const std::string& name = "egl:0")
    {
        return platform().createOffscreen(DisplayDeviceKey(name, "", ""));
    }

    static std::string FailureOf(const std::function<void()>& action)
    {
        try {
            action();
        } catch (const QGF::LogicalException& exception) {
            return exception.message();
        }
        return "no failure";
    }

    Script script;

private:
    std::unique_ptr<EGLPlatform> fPlatform;
};

ScriptedDevice WithNode(const char* node)
{
    return {"EGL_EXT_device_drm", {{EGL_DRM_DEVICE_FILE_EXT, node}}};
}

TEST_F(EGLPlatformTest, MissingCoreFunctionIsNamed)
{
    for (const char* const name :
         {"eglGetError", "eglQueryString", "eglGetDisplay", "eglInitialize", "eglBindAPI",
          "eglChooseConfig", "eglCreateContext", "eglDestroyContext", "eglCreatePbufferSurface",
          "eglDestroySurface", "eglMakeCurrent", "eglGetProcAddress"}) {
        script.absent = {name};
        EXPECT_EQ(FailureOf([this] { platform(); }),
                  std::string(name) + " is not offered by this EGL library");
    }
}

TEST_F(EGLPlatformTest, DeviceWithoutNodeIsNamedByItsPosition)
{
    script.devices = {{"", {}}, {std::nullopt, {}}};
    EXPECT_THAT(devices(), ElementsAre("egl:0|egl:0|", "egl:1|egl:1|"));
}

TEST_F(EGLPlatformTest, DeviceWithNodeGetsAddressAndName)
{
    script.devices = {WithNode("/dev/dri/card0"), WithNode("/dev/dri/card1")};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card0|First Adapter|0000:01:00.0",
                                       "/dev/dri/card1|Second Adapter|0000:02:00.0"));
}

TEST_F(EGLPlatformTest, RenderNodeIsUsedIfThereIsNoOther)
{
    script.devices = {{"EGL_EXT_device_drm EGL_EXT_device_drm_render_node",
                       {{EGL_DRM_DEVICE_FILE_EXT, std::nullopt},
                        {EGL_DRM_RENDER_NODE_FILE_EXT, "/dev/dri/renderD128"}}}};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/renderD128|First Adapter|0000:01:00.0"));
}

TEST_F(EGLPlatformTest, NodeOfAnUnknownAdapterNamesTheDevice)
{
    script.devices = {WithNode("/dev/dri/card7"), WithNode("")};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card7|/dev/dri/card7|", "egl:1|egl:1|"));
}

TEST_F(EGLPlatformTest, HardwareComesBeforeSoftware)
{
    script.devices = {{"EGL_MESA_device_software", {}},
                      WithNode("/dev/dri/card1"),
                      {"EGL_A EGL_MESA_device_software EGL_B", {}},
                      WithNode("/dev/dri/card0")};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card1|Second Adapter|0000:02:00.0",
                                       "/dev/dri/card0|First Adapter|0000:01:00.0", "egl:0|egl:0|",
                                       "egl:2|egl:2|"));
}

TEST_F(EGLPlatformTest, SoftwareIsNeverAnAdapter)
{
    script.devices = {WithNode("/dev/dri/card0")};
    script.devices[0].extensions = "EGL_EXT_device_drm EGL_MESA_device_software";
    EXPECT_THAT(devices(), ElementsAre("egl:0|egl:0|"));
}

TEST_F(EGLPlatformTest, ExtensionNamesAreComparedWhole)
{
    script.devices = {{"EGL_MESA_device_software2 XEGL_EXT_device_drm", {}},
                      WithNode("/dev/dri/card0")};
    EXPECT_THAT(devices(),
                ElementsAre("egl:0|egl:0|", "/dev/dri/card0|First Adapter|0000:01:00.0"));
}

TEST_F(EGLPlatformTest, NvidiaDeviceWithoutNodeIsFoundByItsOwnName)
{
    script.devices = {
        {"EGL_NV_device_cuda EGL_EXT_device_query_name", {{EGL_RENDERER_EXT, "Card 2"}}},
        {"EGL_NV_device_cuda", {}}};
    EXPECT_THAT(devices(), ElementsAre("egl:0|Second Adapter|0000:02:00.0", "egl:1|egl:1|"));
}

// The scripted query fails the test for a string that the device lacks.
TEST_F(EGLPlatformTest, OnlyAnNvidiaDeviceOfUnknownAddressIsAskedForItsName)
{
    script.devices = {{"EGL_EXT_device_query_name", {}},
                      {"EGL_NV_device_cuda EGL_EXT_device_query_name EGL_EXT_device_drm",
                       {{EGL_DRM_DEVICE_FILE_EXT, "/dev/dri/card0"}}},
                      {"EGL_EXT_device_query_name EGL_EXT_device_drm",
                       {{EGL_DRM_DEVICE_FILE_EXT, "/dev/dri/card1"}}}};
    EXPECT_EQ(devices().size(), 3U);
}

TEST_F(EGLPlatformTest, TakenAddressesArePassedToTheLookup)
{
    script.devices = {
        {"EGL_NV_device_cuda EGL_EXT_device_query_name", {{EGL_RENDERER_EXT, "Card 2"}}},
        WithNode("/dev/dri/card1")};
    EXPECT_THAT(devices(),
                ElementsAre("egl:0|egl:0|", "/dev/dri/card1|Second Adapter|0000:02:00.0"));
}

TEST_F(EGLPlatformTest, AnAdaptersDriverComesBeforeTheFirmwaresFramebuffer)
{
    script.devices = {WithNode("/dev/dri/card3"), WithNode("/dev/dri/card1"),
                      WithNode("/dev/dri/card0")};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card1|Second Adapter|0000:02:00.0",
                                       "/dev/dri/card0|First Adapter|0000:01:00.0"));
    EXPECT_NE(create("/dev/dri/card1"), nullptr);
    EXPECT_THAT(script.calls, Contains("eglInitialize 2"));
    EXPECT_THAT(script.calls, Not(Contains("eglInitialize 1")));
}

TEST_F(EGLPlatformTest, TheFirmwaresFramebufferComesBeforeSoftware)
{
    script.devices = {{"EGL_MESA_device_software", {}}, WithNode("/dev/dri/card3")};
    EXPECT_THAT(devices(),
                ElementsAre("/dev/dri/card3|Second Adapter|0000:02:00.0", "egl:0|egl:0|"));
}

TEST_F(EGLPlatformTest, TheFirmwaresFramebufferTakesNoAddressFromItsDriver)
{
    script.devices = {
        WithNode("/dev/dri/card3"),
        {"EGL_NV_device_cuda EGL_EXT_device_query_name", {{EGL_RENDERER_EXT, "Card 2"}}}};
    EXPECT_THAT(devices(), ElementsAre("egl:1|Second Adapter|0000:02:00.0"));
}

TEST_F(EGLPlatformTest, TwoDriversOfOneAdapterAreOneDevice)
{
    script.devices = {
        {"EGL_NV_device_cuda EGL_EXT_device_drm", {{EGL_DRM_DEVICE_FILE_EXT, "/dev/dri/card0"}}},
        WithNode("/dev/dri/card0"),
        WithNode("/dev/dri/renderD128")};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card0|First Adapter|0000:01:00.0"));
    script.calls.clear();
    script.failing = {"eglInitialize 1"};
    EXPECT_NE(create("/dev/dri/card0"), nullptr);
    EXPECT_THAT(script.calls, Contains("eglInitialize 2"));
    EXPECT_THAT(script.calls, Not(Contains("eglInitialize 3")));
}

TEST_F(EGLPlatformTest, AllFailuresOfADeviceAreReported)
{
    script.devices = {WithNode("/dev/dri/card0"), WithNode("/dev/dri/card0")};
    script.failing = {"eglInitialize"};
    EXPECT_EQ(FailureOf([this] { create("/dev/dri/card0"); }),
              "eglInitialize failed for display device /dev/dri/card0: EGL_BAD_ALLOC (0x3003); "
              "eglInitialize failed for display device /dev/dri/card0: EGL_BAD_ALLOC (0x3003)");
}

TEST_F(EGLPlatformTest, EmptyListOfDevicesIsEmpty)
{
    script.devices.clear();
    EXPECT_THAT(devices(), IsEmpty());
    EXPECT_THAT(script.calls, ElementsAre("eglQueryDevicesEXT count"));
}

TEST_F(EGLPlatformTest, OnlyTheFilledPartOfTheListCounts)
{
    script.devices.resize(3);
    for (int filled = 0; filled <= 2; ++filled) {
        script.filledDevices = filled;
        EXPECT_EQ(devices().size(), static_cast<std::size_t>(filled));
    }
}

TEST_F(EGLPlatformTest, NvidiaDevicesAreLookedUpOnlyWithoutANode)
{
    script.devices = {{"EGL_NV_device_cuda EGL_EXT_device_query_name EGL_EXT_device_drm",
                       {{EGL_DRM_DEVICE_FILE_EXT, "/dev/dri/card7"}, {EGL_RENDERER_EXT, "Card 2"}}},
                      {"", {}}};
    EXPECT_THAT(devices(), ElementsAre("/dev/dri/card7|/dev/dri/card7|", "egl:1|egl:1|"));
    EXPECT_THAT(script.calls, Not(Contains("lookup of NVIDIA")));
}

TEST_F(EGLPlatformTest, CountOutOfRangeThrows)
{
    for (const EGLint count : {-1, 4097, 2147483647}) {
        script.claimedDevices = count;
        EXPECT_EQ(FailureOf([this] { devices(); }),
                  "eglQueryDevicesEXT reports " + std::to_string(count) + " devices");
    }
}

TEST_F(EGLPlatformTest, DevicesReportedButNotReturnedAreLeftOut)
{
    script.claimedDevices = 4096;
    EXPECT_THAT(devices(), ElementsAre("egl:0|egl:0|"));
}

TEST_F(EGLPlatformTest, FailedEnumerationIsNamed)
{
    for (const char* const call : {"eglQueryDevicesEXT count", "eglQueryDevicesEXT list"}) {
        script.failing = {call};
        EXPECT_EQ(FailureOf([this] { devices(); }),
                  "eglQueryDevicesEXT failed: EGL_BAD_ALLOC (0x3003)");
    }
}

TEST_F(EGLPlatformTest, OlderNamesOfTheExtensionsAreAccepted)
{
    script.clientExtensions =
        "EGL_EXT_device_enumeration EGL_EXT_device_query EGL_EXT_platform_device";
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglGetPlatformDisplayEXT device1"));
}

TEST_F(EGLPlatformTest, WithoutEnumerationTheSurfacelessPlatformIsTheOnlyDevice)
{
    for (const char* const extensions :
         {"EGL_MESA_platform_surfaceless", "EGL_EXT_device_base EGL_MESA_platform_surfaceless",
          "EGL_EXT_device_enumeration EGL_EXT_platform_device EGL_MESA_platform_surfaceless"}) {
        script.clientExtensions = extensions;
        script.calls.clear();
        EXPECT_THAT(devices(), ElementsAre("egl:0|egl:0|"));
        EXPECT_THAT(script.calls, IsEmpty()) << extensions;
    }
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglGetPlatformDisplayEXT surfaceless"));
}

TEST_F(EGLPlatformTest, AbsentFunctionsCountAsAbsentExtensions)
{
    script.absent = {"eglQueryDevicesEXT"};
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglGetPlatformDisplayEXT surfaceless"));
}

TEST_F(EGLPlatformTest, DefaultDisplayIsTheLastFallback)
{
    script.clientExtensions = std::nullopt;
    EXPECT_THAT(devices(), ElementsAre("egl:0|egl:0|"));
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglGetDisplay"));
    EXPECT_THAT(script.calls, Contains("eglInitialize 100"));
}

TEST_F(EGLPlatformTest, UnknownDeviceThrows)
{
    EXPECT_EQ(FailureOf([this] { create("egl:1"); }), "Unknown display device \"egl:1\"");
    EXPECT_EQ(FailureOf([this] { create(""); }), "Unknown display device \"\"");
}

TEST_F(EGLPlatformTest, ContextUsesNeitherConfigNorSurfaceIfSupported)
{
    devices();
    script.calls.clear();
    {
        const auto context = create();
        context->makeCurrent();
        context->release();
    }
    EXPECT_THAT(script.calls, ElementsAre("eglGetPlatformDisplayEXT device1", "eglInitialize 1",
                                          "eglBindAPI OpenGL", "eglCreateContext plain config0",
                                          "eglBindAPI OpenGL", "eglMakeCurrent context300 surface0",
                                          "eglMakeCurrent context0 surface0", "eglDestroyContext"));
}

TEST_F(EGLPlatformTest, DisplayIsInitialisedOnce)
{
    create();
    create();
    EXPECT_EQ(std::count(script.calls.begin(), script.calls.end(), "eglInitialize 1"), 1);
}

TEST_F(EGLPlatformTest, FailedDisplayIsRetried)
{
    script.failing = {"eglInitialize"};
    EXPECT_EQ(FailureOf([this] { create(); }),
              "eglInitialize failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
    script.failing.clear();
    EXPECT_NE(create(), nullptr);
}

TEST_F(EGLPlatformTest, WithoutSurfacelessContextsAPbufferIsUsed)
{
    script.displayExtensions = "EGL_KHR_no_config_context";
    devices();
    script.calls.clear();
    {
        const auto context = create();
        context->makeCurrent();
    }
    EXPECT_THAT(script.calls,
                ElementsAre("eglGetPlatformDisplayEXT device1", "eglInitialize 1",
                            "eglBindAPI OpenGL", "eglChooseConfig 8888 pbuffer",
                            "eglCreateContext plain config8", "eglCreatePbufferSurface config8",
                            "eglBindAPI OpenGL", "eglMakeCurrent context300 surface400",
                            "eglDestroySurface", "eglDestroyContext"));
}

TEST_F(EGLPlatformTest, NullDisplayExtensionsAreNone)
{
    script.displayExtensions = std::nullopt;
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglCreatePbufferSurface config8"));
}

TEST_F(EGLPlatformTest, FailedPbufferDestroysTheContext)
{
    script.displayExtensions = "";
    script.failing = {"eglCreatePbufferSurface"};
    EXPECT_EQ(FailureOf([this] { create(); }),
              "eglCreatePbufferSurface failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
    EXPECT_EQ(script.calls.back(), "eglDestroyContext");
}

TEST_F(EGLPlatformTest, WithoutConfiglessContextsAConfigIsChosen)
{
    script.displayExtensions = "EGL_KHR_surfaceless_context";
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglChooseConfig 8888"));
    EXPECT_THAT(script.calls, Contains("eglCreateContext plain config8"));
    EXPECT_THAT(script.calls, Not(Contains(StartsWith("eglCreatePbufferSurface"))));
}

TEST_F(EGLPlatformTest, AnyOpenGLConfigIsUsedIfThePreferredIsMissing)
{
    script.displayExtensions = "EGL_KHR_surfaceless_context";
    script.preferred = false;
    EXPECT_NE(create(), nullptr);
    EXPECT_THAT(script.calls, Contains("eglCreateContext plain config9"));
}

TEST_F(EGLPlatformTest, NoConfigThrows)
{
    script.displayExtensions = "";
    script.configs = 0;
    EXPECT_EQ(FailureOf([this] { create(); }),
              "eglChooseConfig finds no OpenGL configuration for display device egl:0");
}

TEST_F(EGLPlatformTest, CompatibilityContextIsTriedIfThePlainOneFails)
{
    script.failing = {"eglCreateContext plain config0"};
    const auto context = create();
    EXPECT_EQ(script.calls.back(), "eglCreateContext compatibility config0");
}

TEST_F(EGLPlatformTest, OldEGLGetsNoProfileAttributes)
{
    script.displayExtensions = "EGL_KHR_surfaceless_context EGL_KHR_no_config_context";
    script.minor = 4;
    script.failing = {"eglCreateContext"};
    EXPECT_THROW(create(), QGF::LogicalException);
    EXPECT_THAT(script.calls, Not(Contains(StartsWith("eglCreateContext compatibility"))));
}

// EGL 1.5 has the attributes; before, an extension has them.
TEST_F(EGLPlatformTest, TheVersionOfEGLDecidesAboutProfileAttributes)
{
    const std::string base = "EGL_KHR_surfaceless_context EGL_KHR_no_config_context";
    const struct {
        EGLint major;
        EGLint minor;
        const char* extension;
        bool has;
    } rows[] = {{1, 4, "", false}, {1, 5, "", true},
                {1, 6, "", true},  {2, 0, "", true},
                {0, 9, "", false}, {0, 5, "", false},
                {2, 4, "", true},  {1, 4, " EGL_KHR_create_context", true}};
    std::size_t device = 0;
    script.devices.resize(std::size(rows)); // each is opened once
    script.failing = {"eglCreateContext plain config0"};
    for (const auto& row : rows) {
        script.major = row.major;
        script.minor = row.minor;
        script.displayExtensions = base + row.extension;
        script.calls.clear();
        create("egl:" + std::to_string(device++));
        EXPECT_EQ(std::count(script.calls.begin(), script.calls.end(),
                             "eglCreateContext compatibility config0"),
                  row.has ? 1 : 0)
            << row.major << '.' << row.minor << row.extension;
    }
}

TEST_F(EGLPlatformTest, ContextWithAConfigIsTriedIfTheOneWithoutFails)
{
    script.failing = {"eglCreateContext plain config0", "eglCreateContext compatibility config0"};
    const auto context = create();
    EXPECT_EQ(script.calls.back(), "eglCreateContext plain config8");
}

TEST_F(EGLPlatformTest, ErrorsAreNamedWithCallAndDevice)
{
    const std::vector<std::pair<const char*, EGLint>> errors = {
        {"EGL_SUCCESS (0x3000)", EGL_SUCCESS},
        {"EGL_NOT_INITIALIZED (0x3001)", EGL_NOT_INITIALIZED},
        {"EGL_BAD_ACCESS (0x3002)", EGL_BAD_ACCESS},
        {"EGL_BAD_ALLOC (0x3003)", EGL_BAD_ALLOC},
        {"EGL_BAD_ATTRIBUTE (0x3004)", EGL_BAD_ATTRIBUTE},
        {"EGL_BAD_CONFIG (0x3005)", EGL_BAD_CONFIG},
        {"EGL_BAD_CONTEXT (0x3006)", EGL_BAD_CONTEXT},
        {"EGL_BAD_CURRENT_SURFACE (0x3007)", EGL_BAD_CURRENT_SURFACE},
        {"EGL_BAD_DISPLAY (0x3008)", EGL_BAD_DISPLAY},
        {"EGL_BAD_MATCH (0x3009)", EGL_BAD_MATCH},
        {"EGL_BAD_NATIVE_PIXMAP (0x300A)", EGL_BAD_NATIVE_PIXMAP},
        {"EGL_BAD_NATIVE_WINDOW (0x300B)", EGL_BAD_NATIVE_WINDOW},
        {"EGL_BAD_PARAMETER (0x300C)", EGL_BAD_PARAMETER},
        {"EGL_BAD_SURFACE (0x300D)", EGL_BAD_SURFACE},
        {"EGL_CONTEXT_LOST (0x300E)", EGL_CONTEXT_LOST},
        {"EGL_BAD_DEVICE_EXT (0x322B)", EGL_BAD_DEVICE_EXT},
        {"0x0000", 0},
        {"0xFFFFFFFF", -1},
    };
    script.failing = {"eglCreateContext"};
    for (const auto& [text, error] : errors) {
        script.error = error;
        EXPECT_EQ(FailureOf([this] { create(); }),
                  std::string("eglCreateContext failed for display device egl:0: ") + text);
    }
}

TEST_F(EGLPlatformTest, FailedCallOfACreationIsNamed)
{
    for (const char* const call : {"eglGetPlatformDisplayEXT", "eglBindAPI"}) {
        script.failing = {call};
        EXPECT_EQ(FailureOf([this] { create(); }),
                  std::string(call) + " failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
    }
}

TEST_F(EGLPlatformTest, FailedChoiceOfAConfigIsNamed)
{
    script.displayExtensions = "";
    script.failing = {"eglChooseConfig"};
    EXPECT_EQ(FailureOf([this] { create(); }),
              "eglChooseConfig failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
}

TEST_F(EGLPlatformTest, DefaultDisplayThatFailsIsNamed)
{
    script.clientExtensions = "";
    script.failing = {"eglGetDisplay"};
    EXPECT_EQ(FailureOf([this] { create(); }),
              "eglGetDisplay failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
}

TEST_F(EGLPlatformTest, FailedMakeCurrentIsNamed)
{
    const auto context = create();
    for (const char* const call : {"eglBindAPI", "eglMakeCurrent"}) {
        script.failing = {call};
        EXPECT_EQ(FailureOf([&] { context->makeCurrent(); }),
                  std::string(call) + " failed for display device egl:0: EGL_BAD_ALLOC (0x3003)");
    }
    context->release();
}

TEST_F(EGLPlatformTest, ExceptionsInDestructorsAreIgnored)
{
    script.displayExtensions = "";
    auto context = create();
    script.throwing = {"eglMakeCurrent", "eglDestroySurface", "eglDestroyContext"};
    context->release();
    context.reset();
    EXPECT_EQ(script.calls.back(), "eglDestroyContext");
}

TEST_F(EGLPlatformTest, EntryPointsComeFromEGL)
{
    const auto context = create();
    EXPECT_NE(context->getProc("glClear"), nullptr);
    EXPECT_EQ(context->getProc("glNoSuchFunction"), nullptr);
}

} // namespace
