// A scripted OpenGL in the place of the machine's own: any number of devices that answer what a
// test tells them to, and a record of what was asked of them.
//
//     FakeOpenGL gl(2);                      // installed until the end of the scope
//     gl.devices[1].strings[kGLVendor] = std::nullopt;   // that device answers null
//     gl.devices[0].onCreate = [] { throw QGF::LogicalException("no"); };
//     ... code under test ...
//     EXPECT_THAT(gl.calls, ElementsAre("create fake0", "makeCurrent fake0", ...));
//
// Devices may be changed between calls, but not moved: set `devices` up before contexts exist.
// All contexts must be gone before the fake is. One fake at a time, on one thread.
#pragma once

#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "qgf/OGL.h"

namespace assay_test {

constexpr std::uint32_t kGLVendor = 0x1F00;
constexpr std::uint32_t kGLRenderer = 0x1F01;
constexpr std::uint32_t kGLVersion = 0x1F02;
constexpr std::uint32_t kGLExtensions = 0x1F03;
constexpr std::uint32_t kGLNumExtensions = 0x821D;
constexpr std::uint32_t kGLMaxRectangleTextureSize = 0x84F8;
constexpr std::uint32_t kGLInvalidEnum = 0x0500;
constexpr std::uint32_t kGLFramebufferComplete = 0x8CD5;

struct FakeDevice {
    // Device name "fakeN", device string "Fake GPU N", display id "0000:0N:00.0".
    explicit FakeDevice(int index);

    QGF::OGL::DisplayDeviceKey key;

    // glGetString by name. A name that isn't there gives null and GL_INVALID_ENUM; no value gives
    // null and no error. At first: vendor "Fake Vendor", renderer "Fake Renderer N", version
    // "4.1 Fake". GL_EXTENSIONS is answered from `extensions` unless it is set here.
    std::map<std::uint32_t, std::optional<std::string>> strings;
    // Extension names, for both ways of asking; no value gives null from glGetStringi.
    std::vector<std::optional<std::string>> extensions;
    // glGetIntegerv by name, as many integers as there are; a name that isn't there gives
    // GL_INVALID_ENUM and writes nothing. GL_NUM_EXTENSIONS is answered from `extensions` unless
    // it is set here. At first: the rectangle texture size, 16384.
    std::map<std::uint32_t, std::vector<std::int32_t>> integers;
    // glGetProgramivARB by target and code, in the same way. At first: none.
    std::map<std::pair<std::uint32_t, std::uint32_t>, std::int32_t> programIntegers;
    // What glGetError gives, from the front; then 0.
    std::deque<std::uint32_t> errors;
    // Entry points that this driver lacks.
    std::set<std::string> missing;

    // Each is called, if set, when the call arrives and before it takes effect; it may throw
    // anything. `onCall` is for OpenGL entry points, by name such as "glClear".
    std::function<void()> onCreate;
    std::function<void()> onMakeCurrent;
    std::map<std::string, std::function<void()>> onCall;

    // Compiling and linking, and the driver's log about a failure. `logLength` is the length that
    // the driver claims; without it the true one, terminating zero included.
    bool vertexCompiles = true;
    bool fragmentCompiles = true;
    bool links = true;
    std::string log = "fake log";
    std::optional<std::int32_t> logLength;

    std::uint32_t framebufferStatus = kGLFramebufferComplete;

    // False: glCreateShader, glCreateProgram, glGenTextures and glGenFramebuffers give 0.
    bool makesObjects = true;

    // What the last glShaderSource handed over, each entry by itself.
    std::vector<std::string> shaderSource;
    bool shaderLengthsGiven = false;
    // Contexts and OpenGL objects that exist now.
    int contexts = 0;
    int objects = 0;
};

class FakeOpenGL {
public:
    // Takes the platform's place.
    explicit FakeOpenGL(int deviceCount = 1);
    // Brings the native platform back.
    ~FakeOpenGL();
    FakeOpenGL(const FakeOpenGL&) = delete;
    FakeOpenGL& operator=(const FakeOpenGL&) = delete;

    // Forgets what the library already knows of devices: needed after a change of `devices` or
    // their keys once the library was asked.
    void reset();

    // A deque: adding a device leaves the others where they are.
    std::deque<FakeDevice> devices;

    // If set, called before the devices are listed; it may throw anything.
    std::function<void()> onDisplayDevices;

    // Everything that was asked, in order: "displayDevices", "create NAME", "makeCurrent NAME",
    // "release NAME", "destroy NAME" with the device's name, and OpenGL's calls, as
    // "glGetString(0x1F01)", "glGetIntegerv(0x84F8)", "glGetProgramivARB(0x8620,0x88B4)",
    // "glClearColor(255,255,255,255)", "glClear(0x4000)", "glGetError()": names and masks in
    // hexadecimal, object ids, sizes and counts in decimal, pointers left out.
    std::vector<std::string> calls;

    // The recorded calls that begin with that text.
    std::vector<std::string> callsOf(const std::string& beginning) const;

    // The device whose context is current natively; null if none is.
    FakeDevice* current = nullptr;
};

} // namespace assay_test
