// QGF::OGL: OpenGL devices, offscreen contexts, shader programs, textures and framebuffers. OpenGL
// is loaded at run time. A context is current per thread; the library takes no lock.
//
// A failed operation throws QGF::LogicalException with a text that says what failed and why.
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

    // Loads the platform's OpenGL binding and lists its display devices. Throws if there is no
    // binding or no display device. After a success, further calls do nothing.
    static void Initialize(const InitOptions& options);
};

// Identifies a device that can display or render. On Windows: the device's name, the adapter's
// description and the device id. On Linux: the DRM node or "egl:N", the adapter's name, and its
// place (qgf/DrmNodes.h) or "".
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

// An OpenGL context and its entry points. Use and destroy it on one thread. The destructor releases
// the context first if it is current.
class Context {
public:
    virtual ~Context();
    Context(const Context&) = delete;
    Context& operator=(const Context&) = delete;

    // Returns the first device that has a name. Throws if there is none.
    static DisplayDeviceKey PrimaryDisplayDevice();

    // Returns the number of display devices; 0 if the binding can't be loaded.
    static int NumDisplayDevice();

    // Sets `key` to that of device `index` and returns true. Returns false if there is no such
    // device or it has no name: the system lists such a device, but no context can be made on it.
    static bool DisplayDevice(int index, DisplayDeviceKey& key);

    // Makes this context current on the calling thread. If it throws, the current context is
    // unchanged.
    void makeCurrent();

    // Returns the context that the library made current on the calling thread; null for none.
    static Context* Current();

    // Returns the entry points, which the first makeCurrent looks up. Throws before that.
    const OpenGLInterceptor& interceptor() const;

    // Returns the context's extensions. The first call reads them; the context must be current.
    ExtensionManager& extensionManager();

protected:
    explicit Context(std::unique_ptr<PlatformContext> context);

private:
    friend class ScopedContextWrapper;
    static void ReleaseCurrent() noexcept;

    std::unique_ptr<PlatformContext> fContext;
    std::unique_ptr<OpenGLInterceptor> fInterceptor;
    std::unique_ptr<ExtensionManager> fExtensionManager;
    // Owns nothing. A ScopedContextWrapper holds a weak pointer to it, which expires with this
    // context.
    std::shared_ptr<Context> fSelf;
};

// A context without a window. It has the compatibility profile, whose fixed-function queries the
// tests use.
class ContextOffscreen : public Context {
public:
    explicit ContextOffscreen(const DisplayDeviceKey& key);
    ~ContextOffscreen() override;
};

// Saves the context that is current on this thread. If `restore` is true, the destructor makes it
// current again. If there was none, or it has been destroyed or can't be made current, no context
// is current afterwards; the destructor never throws.
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

    // Compiles a shader from `count` strings and attaches it to the program. `lengths` are the
    // strings' lengths; null means that the strings are zero-terminated. Throws with the driver's
    // log.
    void loadVertexShader(int count, const char* const* strings, const std::int32_t* lengths);
    void loadFragmentShader(int count, const char* const* strings, const std::int32_t* lengths);

    // Links the loaded shaders. Throws with the driver's log. If `requireShaders` is true, throws
    // without calling the driver if one of the two shaders is missing.
    void link(bool requireShaders);

private:
    void LoadShader(std::uint32_t kind, const char* kindName, int count, const char* const* strings,
                    const std::int32_t* lengths);

    std::uint32_t fProgram = 0;
    bool fHasVertexShader = false;
    bool fHasFragmentShader = false;
};

// The texture formats that the library supports. The values are the library's own.
enum class InternalFormat : std::int32_t { RGBA8 = 34 };

// The type of the pixel data. Default is the usual type of the format.
enum class Type : std::int32_t { Default = -1 };

// A two-dimensional texture. Needs a current context from construction to destruction. An OpenGL
// error that its calls raise stays in OpenGL's queue for the caller's glGetError.
class Texture2D {
public:
    // If `data` is null, the content is undefined. If `mipmaps` is true, all levels are made.
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
    // be bound. Throws if the framebuffer is then not complete; the text has the first OpenGL error
    // of the queue, which most often comes from the texture.
    void attach(const Texture2D& texture, std::uint32_t attachment, std::uint32_t level);

private:
    std::uint32_t fFramebuffer = 0;
};

} // namespace OGL
} // namespace QGF
