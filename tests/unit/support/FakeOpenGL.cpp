#include "support/FakeOpenGL.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <sstream>
#include <stdexcept>

#include "qgf/OGLPlatform.h"

namespace assay_test {

namespace {

FakeOpenGL* gFake = nullptr;
std::uint32_t gNextObject = 1;

constexpr std::uint32_t kVertexShader = 0x8B31;
constexpr std::uint32_t kCompileStatus = 0x8B81;
constexpr std::uint32_t kLinkStatus = 0x8B82;
constexpr std::uint32_t kInfoLogLength = 0x8B84;

// The kinds of the shaders, by id.
std::map<std::uint32_t, std::uint32_t> gShaderKinds;

std::string Hex(std::uint32_t value)
{
    std::ostringstream text;
    text << "0x" << std::hex << std::uppercase << value;
    return text.str();
}

template <typename T>
std::string Dec(T value)
{
    std::ostringstream text;
    text << value;
    return text.str();
}

// Records the call, calls the test's function for it, and returns the device of the current
// context.
FakeDevice& Enter(const char* name, const std::vector<std::string>& arguments)
{
    std::string call = std::string(name) + "(";
    for (std::size_t i = 0; i < arguments.size(); ++i)
        call += (i != 0 ? "," : "") + arguments[i];
    gFake->calls.push_back(call + ")");
    if (gFake->current == nullptr)
        throw std::logic_error(std::string(name) + " was called with no context current");
    FakeDevice& device = *gFake->current;
    const auto action = device.onCall.find(name);
    if (action != device.onCall.end() && action->second)
        action->second();
    return device;
}

const std::uint8_t* Bytes(const std::string& text)
{
    return reinterpret_cast<const std::uint8_t*>(text.c_str());
}

std::uint32_t MakeObject(FakeDevice& device)
{
    if (!device.makesObjects)
        return 0;
    ++device.objects;
    return gNextObject++;
}

const std::uint8_t* GetString(std::uint32_t name)
{
    FakeDevice& device = Enter("glGetString", {Hex(name)});
    const auto found = device.strings.find(name);
    if (found != device.strings.end())
        return found->second ? Bytes(*found->second) : nullptr;
    if (name == kGLExtensions) {
        // OpenGL's strings live as long as the context.
        static std::string list;
        list.clear();
        for (const auto& extension : device.extensions)
            list += extension.value_or("") + " ";
        return Bytes(list);
    }
    device.errors.push_back(kGLInvalidEnum);
    return nullptr;
}

const std::uint8_t* GetStringi(std::uint32_t name, std::uint32_t index)
{
    FakeDevice& device = Enter("glGetStringi", {Hex(name), Dec(index)});
    if (name != kGLExtensions || index >= device.extensions.size()) {
        device.errors.push_back(name != kGLExtensions ? kGLInvalidEnum : 0x0501);
        return nullptr;
    }
    const auto& extension = device.extensions[index];
    return extension ? Bytes(*extension) : nullptr;
}

std::uint32_t GetError()
{
    FakeDevice& device = Enter("glGetError", {});
    if (device.errors.empty())
        return 0;
    const std::uint32_t error = device.errors.front();
    device.errors.pop_front();
    return error;
}

void GetIntegerv(std::uint32_t name, std::int32_t* result)
{
    FakeDevice& device = Enter("glGetIntegerv", {Hex(name)});
    const auto found = device.integers.find(name);
    if (found != device.integers.end())
        std::copy(found->second.begin(), found->second.end(), result);
    else if (name == kGLNumExtensions)
        *result = static_cast<std::int32_t>(device.extensions.size());
    else
        device.errors.push_back(kGLInvalidEnum);
}

void GetProgramivARB(std::uint32_t target, std::uint32_t code, std::int32_t* result)
{
    FakeDevice& device = Enter("glGetProgramivARB", {Hex(target), Hex(code)});
    const auto found = device.programIntegers.find({target, code});
    if (found != device.programIntegers.end())
        *result = found->second;
    else
        device.errors.push_back(kGLInvalidEnum);
}

void ClearColor(float red, float green, float blue, float alpha)
{
    Enter("glClearColor", {Dec(red), Dec(green), Dec(blue), Dec(alpha)});
}

void Clear(std::uint32_t mask)
{
    Enter("glClear", {Hex(mask)});
}

std::uint32_t CreateShader(std::uint32_t kind)
{
    const std::uint32_t shader = MakeObject(Enter("glCreateShader", {Hex(kind)}));
    gShaderKinds[shader] = kind;
    return shader;
}

void ShaderSource(std::uint32_t shader, std::int32_t count, const char* const* strings,
                  const std::int32_t* lengths)
{
    FakeDevice& device = Enter("glShaderSource", {Dec(shader), Dec(count)});
    device.shaderSource.clear();
    device.shaderLengthsGiven = lengths != nullptr;
    for (std::int32_t i = 0; i < count; ++i) {
        const bool counted = lengths != nullptr && lengths[i] >= 0;
        device.shaderSource.emplace_back(strings[i], counted ? static_cast<std::size_t>(lengths[i])
                                                             : std::strlen(strings[i]));
    }
}

void CompileShader(std::uint32_t shader)
{
    Enter("glCompileShader", {Dec(shader)});
}

std::int32_t LogLength(const FakeDevice& device)
{
    return device.logLength.value_or(static_cast<std::int32_t>(device.log.size() + 1));
}

void GetShaderiv(std::uint32_t shader, std::uint32_t name, std::int32_t* result)
{
    FakeDevice& device = Enter("glGetShaderiv", {Dec(shader), Hex(name)});
    if (name == kCompileStatus)
        *result =
            gShaderKinds[shader] == kVertexShader ? device.vertexCompiles : device.fragmentCompiles;
    else if (name == kInfoLogLength)
        *result = LogLength(device);
}

void CopyLog(const FakeDevice& device, std::int32_t size, std::int32_t* length, char* text)
{
    const std::size_t room = static_cast<std::size_t>(std::max(size, 1)) - 1;
    const std::size_t copied = std::min(room, device.log.size());
    std::memcpy(text, device.log.data(), copied);
    text[copied] = '\0';
    if (length != nullptr)
        *length = static_cast<std::int32_t>(copied);
}

void GetShaderInfoLog(std::uint32_t shader, std::int32_t size, std::int32_t* length, char* text)
{
    CopyLog(Enter("glGetShaderInfoLog", {Dec(shader), Dec(size)}), size, length, text);
}

void DeleteShader(std::uint32_t shader)
{
    --Enter("glDeleteShader", {Dec(shader)}).objects;
}

std::uint32_t CreateProgram()
{
    return MakeObject(Enter("glCreateProgram", {}));
}

void AttachShader(std::uint32_t program, std::uint32_t shader)
{
    Enter("glAttachShader", {Dec(program), Dec(shader)});
}

void LinkProgram(std::uint32_t program)
{
    Enter("glLinkProgram", {Dec(program)});
}

void GetProgramiv(std::uint32_t program, std::uint32_t name, std::int32_t* result)
{
    FakeDevice& device = Enter("glGetProgramiv", {Dec(program), Hex(name)});
    if (name == kLinkStatus)
        *result = device.links;
    else if (name == kInfoLogLength)
        *result = LogLength(device);
}

void GetProgramInfoLog(std::uint32_t program, std::int32_t size, std::int32_t* length, char* text)
{
    CopyLog(Enter("glGetProgramInfoLog", {Dec(program), Dec(size)}), size, length, text);
}

void DeleteProgram(std::uint32_t program)
{
    --Enter("glDeleteProgram", {Dec(program)}).objects;
}

void Generate(FakeDevice& device, std::int32_t count, std::uint32_t* ids)
{
    for (std::int32_t i = 0; i < count; ++i)
        ids[i] = MakeObject(device);
}

void GenTextures(std::int32_t count, std::uint32_t* ids)
{
    Generate(Enter("glGenTextures", {Dec(count)}), count, ids);
}

void BindTexture(std::uint32_t target, std::uint32_t id)
{
    Enter("glBindTexture", {Hex(target), Dec(id)});
}

void TexParameteri(std::uint32_t target, std::uint32_t name, std::int32_t value)
{
    Enter("glTexParameteri", {Hex(target), Hex(name), Hex(static_cast<std::uint32_t>(value))});
}

void TexImage2D(std::uint32_t target, std::int32_t level, std::int32_t internalFormat,
                std::int32_t width, std::int32_t height, std::int32_t border, std::uint32_t format,
                std::uint32_t type, const void*)
{
    Enter("glTexImage2D", {Hex(target), Dec(level), Hex(static_cast<std::uint32_t>(internalFormat)),
                           Dec(width), Dec(height), Dec(border), Hex(format), Hex(type)});
}

void GenerateMipmap(std::uint32_t target)
{
    Enter("glGenerateMipmap", {Hex(target)});
}

void DeleteTextures(std::int32_t count, const std::uint32_t* ids)
{
    Enter("glDeleteTextures", {Dec(count), Dec(*ids)}).objects -= count;
}

void GenFramebuffers(std::int32_t count, std::uint32_t* ids)
{
    Generate(Enter("glGenFramebuffers", {Dec(count)}), count, ids);
}

void BindFramebuffer(std::uint32_t target, std::uint32_t id)
{
    Enter("glBindFramebuffer", {Hex(target), Dec(id)});
}

void FramebufferTexture2D(std::uint32_t target, std::uint32_t attachment,
                          std::uint32_t textureTarget, std::uint32_t texture, std::int32_t level)
{
    Enter("glFramebufferTexture2D",
          {Hex(target), Hex(attachment), Hex(textureTarget), Dec(texture), Dec(level)});
}

std::uint32_t CheckFramebufferStatus(std::uint32_t target)
{
    return Enter("glCheckFramebufferStatus", {Hex(target)}).framebufferStatus;
}

void DeleteFramebuffers(std::int32_t count, const std::uint32_t* ids)
{
    Enter("glDeleteFramebuffers", {Dec(count), Dec(*ids)}).objects -= count;
}

template <typename Function>
QGF::Core::Proc AsProc(Function function)
{
    return reinterpret_cast<QGF::Core::Proc>(function);
}

const std::map<std::string, QGF::Core::Proc>& EntryPoints()
{
    static const std::map<std::string, QGF::Core::Proc> entryPoints = {
        {"glGetString", AsProc(GetString)},
        {"glGetStringi", AsProc(GetStringi)},
        {"glGetError", AsProc(GetError)},
        {"glGetIntegerv", AsProc(GetIntegerv)},
        {"glGetProgramivARB", AsProc(GetProgramivARB)},
        {"glClearColor", AsProc(ClearColor)},
        {"glClear", AsProc(Clear)},
        {"glCreateShader", AsProc(CreateShader)},
        {"glShaderSource", AsProc(ShaderSource)},
        {"glCompileShader", AsProc(CompileShader)},
        {"glGetShaderiv", AsProc(GetShaderiv)},
        {"glGetShaderInfoLog", AsProc(GetShaderInfoLog)},
        {"glDeleteShader", AsProc(DeleteShader)},
        {"glCreateProgram", AsProc(CreateProgram)},
        {"glAttachShader", AsProc(AttachShader)},
        {"glLinkProgram", AsProc(LinkProgram)},
        {"glGetProgramiv", AsProc(GetProgramiv)},
        {"glGetProgramInfoLog", AsProc(GetProgramInfoLog)},
        {"glDeleteProgram", AsProc(DeleteProgram)},
        {"glGenTextures", AsProc(GenTextures)},
        {"glBindTexture", AsProc(BindTexture)},
        {"glTexParameteri", AsProc(TexParameteri)},
        {"glTexImage2D", AsProc(TexImage2D)},
        {"glGenerateMipmap", AsProc(GenerateMipmap)},
        {"glDeleteTextures", AsProc(DeleteTextures)},
        {"glGenFramebuffers", AsProc(GenFramebuffers)},
        {"glBindFramebuffer", AsProc(BindFramebuffer)},
        {"glFramebufferTexture2D", AsProc(FramebufferTexture2D)},
        {"glCheckFramebufferStatus", AsProc(CheckFramebufferStatus)},
        {"glDeleteFramebuffers", AsProc(DeleteFramebuffers)},
    };
    return entryPoints;
}

class FakeContext : public QGF::OGL::PlatformContext {
public:
    FakeContext(FakeOpenGL& fake, FakeDevice& device) : fFake(fake), fDevice(device)
    {
        ++fDevice.contexts;
    }

    ~FakeContext() override
    {
        fFake.calls.push_back("destroy " + fDevice.key.deviceName());
        --fDevice.contexts;
    }

    FakeContext(const FakeContext&) = delete;
    FakeContext& operator=(const FakeContext&) = delete;

    void makeCurrent() override
    {
        fFake.calls.push_back("makeCurrent " + fDevice.key.deviceName());
        if (fDevice.onMakeCurrent)
            fDevice.onMakeCurrent();
        fFake.current = &fDevice;
    }

    void release() noexcept override
    {
        fFake.calls.push_back("release " + fDevice.key.deviceName());
        fFake.current = nullptr;
    }

    QGF::Core::Proc getProc(const char* name) override
    {
        const auto found = EntryPoints().find(name);
        const bool offered = found != EntryPoints().end() && fDevice.missing.count(name) == 0;
        return offered ? found->second : nullptr;
    }

private:
    FakeOpenGL& fFake;
    FakeDevice& fDevice;
};

class FakePlatform : public QGF::OGL::Platform {
public:
    explicit FakePlatform(FakeOpenGL& fake) : fFake(fake) {}

    std::vector<QGF::OGL::DisplayDeviceKey> displayDevices() override
    {
        fFake.calls.emplace_back("displayDevices");
        if (fFake.onDisplayDevices)
            fFake.onDisplayDevices();
        std::vector<QGF::OGL::DisplayDeviceKey> keys;
        for (const FakeDevice& device : fFake.devices)
            keys.push_back(device.key);
        return keys;
    }

    std::unique_ptr<QGF::OGL::PlatformContext>
    createOffscreen(const QGF::OGL::DisplayDeviceKey& key) override
    {
        fFake.calls.push_back("create " + key.deviceName());
        for (FakeDevice& device : fFake.devices) {
            if (device.key.deviceName() != key.deviceName())
                continue;
            if (device.onCreate)
                device.onCreate();
            return std::make_unique<FakeContext>(fFake, device);
        }
        throw QGF::LogicalException("Unknown display device \"" + key.deviceName() + "\"");
    }

private:
    FakeOpenGL& fFake;
};

} // namespace

FakeDevice::FakeDevice(int index)
    : key("fake" + std::to_string(index), "Fake GPU " + std::to_string(index),
          "0000:0" + std::to_string(index) + ":00.0"),
      strings{{kGLVendor, "Fake Vendor"},
              {kGLRenderer, "Fake Renderer " + std::to_string(index)},
              {kGLVersion, "4.1 Fake"}},
      integers{{kGLMaxRectangleTextureSize, {16384}}}
{}

FakeOpenGL::FakeOpenGL(int deviceCount)
{
    for (int i = 0; i < deviceCount; ++i)
        devices.emplace_back(i);
    gFake = this;
    gNextObject = 1;
    gShaderKinds.clear();
    reset();
}

FakeOpenGL::~FakeOpenGL()
{
    QGF::OGL::ReplacePlatform(nullptr);
    gFake = nullptr;
}

void FakeOpenGL::reset()
{
    QGF::OGL::ReplacePlatform(std::make_unique<FakePlatform>(*this));
}

std::vector<std::string> FakeOpenGL::callsOf(const std::string& beginning) const
{
    std::vector<std::string> found;
    std::copy_if(
        calls.begin(), calls.end(), std::back_inserter(found),
        [&](const std::string& call) { return call.compare(0, beginning.size(), beginning) == 0; });
    return found;
}

} // namespace assay_test
