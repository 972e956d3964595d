// QGF::OGL: OpenGL devices, offscreen contexts and the few objects made in them. OpenGL itself is
// loaded at run time. A context is current per thread; the library takes no lock.
//
// Everything here throws QGF::LogicalException with a text that says what failed and why.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "qgf/Core.h"
#include "qgf/OGLInterceptor.h"

namespace QGF {
namespace OGL {

class Platform; // NOLINT(bugprone-forward-declaration-namespace): QGF::OCL has one of that name
class PlatformContext;

class Library {
public:
    struct InitOptions {};

    // Loads the platform's OpenGL binding and looks up its display devices. Throws if there is no
    // binding or no display device. Repeating it tries again only after a failure.
    static void Initialize(const InitOptions& options);
};

// A device that can display or render, by three texts: the system's name of the device, the text
// that a person knows it by, and the place where it sits.
class DisplayDeviceKey {
public:
    DisplayDeviceKey() = default;
    DisplayDeviceKey(std::string deviceName, std::string deviceString, std::string displayID)
        : fDeviceName(std::move(deviceName)),
          fDeviceString(std::move(deviceString)),
          fDisplayID(std::move(displayID))
    {}

    const std::string& deviceName() const { return fDeviceName; }
    const std::string& deviceString() const { return fDeviceString; }
    const std::string& displayID() const { return fDisplayID; }

private:
    std::string fDeviceName;
    std::string fDeviceString;
    std::string fDisplayID;
};

// An OpenGL context and its entry points. Destroy it on the thread that uses it; a context that is
// current then is released first.
class Context {
public:
    virtual ~Context();
    Context(const Context&) = delete;
    Context& operator=(const Context&) = delete;

    // The device that new contexts go to by default: the first one. Throws if there is none.
    static DisplayDeviceKey PrimaryDisplayDevice();

    // How many display devices there are; 0 if the binding can't be loaded.
    static int NumDisplayDevice();

    // Fills the key of device `index` and tells whether there is such a device. False also for a
    // device without a name: the system counts it, but no context can be made on it.
    static bool DisplayDevice(int index, DisplayDeviceKey& key);

    // Makes this context current on the calling thread. After an exception the context that was
    // current before still is.
    void makeCurrent();

    // The context that the library made current on the calling thread; null if there is none.
    static Context* Current();

    // The entry points, looked up when the context becomes current for the first time. Throws
    // before that.
    const OpenGLInterceptor& interceptor() const;

    // Read at the first question, which must come while this context is current.
    ExtensionManager& extensionManager();

protected:
    explicit Context(std::unique_ptr<PlatformContext> context);

private:
    friend class ScopedContextWrapper;
    static void ReleaseCurrent() noexcept;

    std::unique_ptr<PlatformContext> fContext;
    std::unique_ptr<OpenGLInterceptor> fInterceptor;
    std::unique_ptr<ExtensionManager> fExtensionManager;
    // Owns nothing; others hold weak pointers to it to see whether this context still lives.
    std::shared_ptr<Context> fSelf;
};

// A context with no window: a compatibility context, so that the fixed-function names exist.
class ContextOffscreen : public Context {
public:
    // Makes a context on the device of that key.
    explicit ContextOffscreen(const DisplayDeviceKey& key);
    ~ContextOffscreen() override;
};

// Remembers which context is current on this thread, and with `restore` set makes that one current
// again, or none, at the end of the scope. None also if that context is gone or can't be made
// current again: the end of the scope never throws.
class ScopedContextWrapper {
public:
    explicit ScopedContextWrapper(bool restore);
    ~ScopedContextWrapper();
    ScopedContextWrapper(const ScopedContextWrapper&) = delete;
    ScopedContextWrapper& operator=(const ScopedContextWrapper&) = delete;

private:
    bool fRestore;
    std::weak_ptr<Context> fPrevious;
};

// A shader program. Needs a current context from construction to destruction.
class Program {
public:
    Program();
    ~Program();
    Program(const Program&) = delete;
    Program& operator=(const Program&) = delete;

    // Compiles one shader from `count` strings, zero-terminated where `lengths` is null, and adds
    // it to the program. Throws with the driver's log.
    void loadVertexShader(int count, const char* const* strings, const std::int32_t* lengths);
    void loadFragmentShader(int count, const char* const* strings, const std::int32_t* lengths);

    // Links what was loaded. With `requireShaders` set a program that lacks one of its two shaders
    // is refused before the driver is asked. Throws with the driver's log.
    void link(bool requireShaders);

private:
    void LoadShader(std::uint32_t kind, const char* kindName, int count, const char* const* strings,
                    const std::int32_t* lengths);

    std::uint32_t fProgram = 0;
    bool fHasVertexShader = false;
    bool fHasFragmentShader = false;
};

// The texture formats that the library knows, by its own numbers.
enum class InternalFormat : std::int32_t { RGBA8 = 34 };

// The type of the data handed over; Default is the format's natural one.
enum class Type : std::int32_t { Default = -1 };

// A two-dimensional texture. Needs a current context from construction to destruction. An OpenGL
// error raised on the way stays in OpenGL's queue for the caller's own question.
class Texture2D {
public:
    // `data` may be null: the content is undefined then. `mipmaps` asks for a full set of levels.
    // Leaves no texture bound.
    Texture2D(InternalFormat format, std::int32_t width, std::int32_t height, bool mipmaps,
              const void* data, Type type);
    ~Texture2D();
    Texture2D(const Texture2D&) = delete;
    Texture2D& operator=(const Texture2D&) = delete;

    std::uint32_t id() const { return fTexture; }

private:
    Texture2D();

    std::uint32_t fTexture = 0;
};

// A framebuffer object. Needs a current context from construction to destruction.
class Framebuffer {
public:
    Framebuffer();
    ~Framebuffer();
    Framebuffer(const Framebuffer&) = delete;
    Framebuffer& operator=(const Framebuffer&) = delete;

    void bind();
    void unbind();

    // Attaches a level of the texture as the colour attachment of that index. The framebuffer must
    // be bound. Throws if the driver then doesn't call the framebuffer complete; the first OpenGL
    // error in the queue, most often that of the texture, goes into the text.
    void attach(const Texture2D& texture, std::uint32_t attachment, std::uint32_t level);

private:
    std::uint32_t fFramebuffer = 0;
};

} // namespace OGL
} // namespace QGF
