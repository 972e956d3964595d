// A fake OpenGL with any number of devices. It records its calls and returns what a test sets.
//
//     FakeOpenGL gl(2);                      // replaces the native OpenGL until the end of the
//     scope gl.devices[1].strings[kGLVendor] = std::nullopt;   // glGetString returns null
//     gl.devices[0].onCreate = [] { throw QGF::LogicalException("no"); };
//     ... code under test ...
//     EXPECT_THAT(gl.calls, ElementsAre("create fake0", "makeCurrent fake0", ...));
//
// Devices may be changed between calls, but not moved: fill `devices` before contexts exist.
// Destroy all contexts before the fake. Make only one fake at a time, and use it on one thread.
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

    // The results of glGetString by name. A missing name gives null and GL_INVALID_ENUM; nullopt
    // gives null without an error. Initially vendor "Fake Vendor", renderer "Fake Renderer N" and
    // version "4.1 Fake". GL_EXTENSIONS comes from `extensions` unless it is set here.
    std::map<std::uint32_t, std::optional<std::string>> strings;
    // Extension names, for glGetString and glGetStringi; for nullopt, glGetStringi returns null.
    std::vector<std::optional<std::string>> extensions;
    // The results of glGetIntegerv by name. A missing name gives GL_INVALID_ENUM and writes
    // nothing. GL_NUM_EXTENSIONS comes from `extensions` unless it is set here. Initially the
    // rectangle texture size, 16384.
    std::map<std::uint32_t, std::vector<std::int32_t>> integers;
    // The results of glGetProgramivARB by target and code, in the same way. Initially empty.
    std::map<std::pair<std::uint32_t, std::uint32_t>, std::int32_t> programIntegers;
    // The results of glGetError, from the front; then 0.
    std::deque<std::uint32_t> errors;
    // Entry points that this driver lacks.
    std::set<std::string> missing;

    // If set, called before the call takes effect; they may throw anything. `onCall` is for OpenGL
    // entry points, by name such as "glClear".
    std::function<void()> onCreate;
    std::function<void()> onMakeCurrent;
    std::map<std::string, std::function<void()>> onCall;

    // The results of compiling and linking, and the driver's log. `logLength` is the reported
    // length; empty: the true length with the terminating zero.
    bool vertexCompiles = true;
    bool fragmentCompiles = true;
    bool links = true;
    std::string log = "fake log";
    std::optional<std::int32_t> logLength;

    std::uint32_t framebufferStatus = kGLFramebufferComplete;

    // If false, glCreateShader, glCreateProgram, glGenTextures and glGenFramebuffers return 0.
    bool makesObjects = true;

    // The strings of the last glShaderSource, and whether it had lengths.
    std::vector<std::string> shaderSource;
    bool shaderLengthsGiven = false;
    // The numbers of live contexts and OpenGL objects.
    int contexts = 0;
    int objects = 0;
};

class FakeOpenGL {
public:
    // Replaces the native platform.
    explicit FakeOpenGL(int deviceCount = 1);
    // Restores the native platform.
    ~FakeOpenGL();
    FakeOpenGL(const FakeOpenGL&) = delete;
    FakeOpenGL& operator=(const FakeOpenGL&) = delete;

    // Clears the library's cached list of devices. Call it after a change of `devices` or their
    // keys if the library has listed them.
    void reset();

    // A deque, so that adding a device doesn't move the others.
    std::deque<FakeDevice> devices;

    // If set, called before the devices are listed; it may throw anything.
    std::function<void()> onDisplayDevices;

    // The calls in order: "displayDevices", "create NAME", "makeCurrent NAME", "release NAME",
    // "destroy NAME" with the device's name, and OpenGL's calls as "glGetString(0x1F01)",
    // "glGetIntegerv(0x84F8)", "glGetProgramivARB(0x8620,0x88B4)", "glClearColor(255,255,255,255)",
    // "glClear(0x4000)", "glGetError()": names and masks in hexadecimal, object ids, sizes and
    // counts in decimal, no pointers.
    std::vector<std::string> calls;

    // Returns the recorded calls that start with that text.
    std::vector<std::string> callsOf(const std::string& beginning) const;

    // The device whose context is current in the platform; null for none.
    FakeDevice* current = nullptr;
};

} // namespace assay_test
