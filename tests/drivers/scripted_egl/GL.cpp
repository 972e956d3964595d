// The OpenGL half: the queries and objects of a context.
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <sstream>

#include "Driver.h"

#include <GL/gl.h>
#include <GL/glext.h>

namespace scripted {

namespace {

Device& DeviceOfContext(const ContextObject& context)
{
    return GetModel().devices[static_cast<std::size_t>(context.device)];
}

// A call in the current context with the effect of the rules. A call without a context does
// nothing.
struct Call {
    ContextObject* context = CurrentContext();
    Effect effect;

    Call(const char* name, const std::vector<Argument>& arguments, Result result = Result::Other)
        : effect(GetModel().monitor.Enter(name, context == nullptr ? -1 : context->device,
                                          arguments, result))
    {
        if (effect.claim)
            effect.returns = effect.claim;
        if (effect.error)
            Error(static_cast<GLenum>(*effect.error));
    }
    bool Over() const
    {
        return context == nullptr || effect.error || effect.returns || effect.text != nullptr;
    }
    // The text that the rules return; null for none.
    const GLubyte* Text() const
    {
        return effect.text != nullptr ? reinterpret_cast<const GLubyte*>(effect.text->c_str())
                                      : nullptr;
    }
    std::int64_t Answer() const { return effect.returns.value_or(0); }
    GLState& GL() const { return context->gl; }
    Device& Model() const { return DeviceOfContext(*context); }
    void Error(GLenum error) const
    {
        if (context != nullptr && error != GL_NO_ERROR)
            context->gl.errors.push_back(error);
    }
};

std::vector<std::string> Extensions(const Device& device)
{
    std::vector<std::string> names;
    const auto list = device.glTexts.find(GL_EXTENSIONS);
    if (list != device.glTexts.end()) {
        std::istringstream words(list->second.value_or(""));
        for (std::string each; words >> each;)
            names.push_back(each);
    }
    return names;
}

const GLubyte* AsBytes(const char* text)
{
    return reinterpret_cast<const GLubyte*>(text);
}

const GLubyte* GetString(GLenum name)
{
    const Call call("glGetString", {Enum(name)}, Result::Text);
    if (call.Over())
        return call.Text();
    const Texts& texts = call.Model().glTexts;
    const auto found = texts.find(name);
    if (found == texts.end()) {
        call.Error(GL_INVALID_ENUM);
        return nullptr;
    }
    return found->second ? AsBytes(found->second->c_str()) : nullptr;
}

const GLubyte* GetStringi(GLenum name, GLuint index)
{
    const Call call("glGetStringi", {Enum(name), Number(index)}, Result::Text);
    if (call.Over())
        return call.Text();
    if (name != GL_EXTENSIONS) {
        call.Error(GL_INVALID_ENUM);
        return nullptr;
    }
    // Never freed: the caller may keep the pointer.
    static auto* const kNames = new std::map<const Device*, std::vector<std::string>>;
    std::vector<std::string>& names = (*kNames)[&call.Model()];
    if (names.empty())
        names = Extensions(call.Model());
    if (index >= names.size()) {
        call.Error(GL_INVALID_VALUE);
        return nullptr;
    }
    return AsBytes(names[index].c_str());
}

GLenum GetError()
{
    const Call call("glGetError", {}, Result::Number);
    if (call.effect.returns)
        return static_cast<GLenum>(*call.effect.returns);
    if (call.context == nullptr || call.GL().errors.empty())
        return GL_NO_ERROR;
    const GLenum error = call.GL().errors.front();
    call.GL().errors.pop_front();
    return error;
}

// Parses the version at the start of the device's GL_VERSION; 0.0 if there is none.
std::pair<GLint, GLint> Version(const Device& device)
{
    int major = 0;
    int minor = 0;
    const auto text = device.glTexts.find(GL_VERSION);
    if (text != device.glTexts.end() && text->second &&
        std::sscanf(text->second->c_str(), "%d.%d", &major, &minor) != 2)
        return {0, 0};
    return {major, minor};
}

void GetIntegerv(GLenum name, GLint* result)
{
    const Call call("glGetIntegerv", {Enum(name)}, Result::Number);
    if (call.Over()) {
        if (call.effect.returns)
            *result = static_cast<GLint>(call.Answer());
        return;
    }
    const Device& device = call.Model();
    const auto found = device.integers.find(name);
    if (found != device.integers.end())
        std::copy(found->second.begin(), found->second.end(), result);
    else if (Version(device).first >= 3 && name == GL_MAJOR_VERSION)
        *result = Version(device).first;
    else if (Version(device).first >= 3 && name == GL_MINOR_VERSION)
        *result = Version(device).second;
    else if (Version(device).first >= 3 && name == GL_NUM_EXTENSIONS)
        *result = static_cast<GLint>(Extensions(device).size());
    else
        call.Error(GL_INVALID_ENUM);
}

void GetProgramivARB(GLenum target, GLenum name, GLint* result)
{
    const Call call("glGetProgramivARB", {Enum(target), Enum(name)}, Result::Number);
    if (call.Over()) {
        if (call.effect.returns)
            *result = static_cast<GLint>(call.Answer());
        return;
    }
    const auto found = call.Model().programLimits.find(name);
    if (target != GL_FRAGMENT_PROGRAM_ARB || found == call.Model().programLimits.end()) {
        call.Error(GL_INVALID_ENUM);
        return;
    }
    std::copy(found->second.begin(), found->second.end(), result);
}

Argument Float(GLfloat value)
{
    std::ostringstream text;
    text << value;
    return {text.str(), {}};
}

void ClearColor(GLfloat red, GLfloat green, GLfloat blue, GLfloat alpha)
{
    const Call call("glClearColor", {Float(red), Float(green), Float(blue), Float(alpha)});
}

GLenum FramebufferStatus(const GLState& gl)
{
    if (gl.boundFramebuffer == 0)
        return GL_FRAMEBUFFER_UNDEFINED;
    const GLuint texture = gl.framebuffers.at(gl.boundFramebuffer);
    if (texture == 0)
        return GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT;
    const auto image = gl.textures.find(texture);
    return image != gl.textures.end() && image->second ? GL_FRAMEBUFFER_COMPLETE
                                                       : GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT;
}

void Clear(GLbitfield mask)
{
    const Call call("glClear", {Enum(mask)});
    if (!call.Over() && FramebufferStatus(call.GL()) != GL_FRAMEBUFFER_COMPLETE)
        call.Error(GL_INVALID_FRAMEBUFFER_OPERATION);
}

GLuint CreateShader(GLenum kind)
{
    const Call call("glCreateShader", {Enum(kind)}, Result::Number);
    if (call.Over())
        return static_cast<GLuint>(call.Answer());
    if (kind != GL_VERTEX_SHADER && kind != GL_FRAGMENT_SHADER) {
        call.Error(GL_INVALID_ENUM);
        return 0;
    }
    const GLuint id = call.GL().nextID++;
    call.GL().shaders[id].kind = kind;
    return id;
}

GLState::Shader* ShaderOf(const Call& call, GLuint id)
{
    const auto found = call.GL().shaders.find(id);
    if (found == call.GL().shaders.end()) {
        call.Error(GL_INVALID_VALUE);
        return nullptr;
    }
    return &found->second;
}

GLState::Program* ProgramOf(const Call& call, GLuint id)
{
    const auto found = call.GL().programs.find(id);
    if (found == call.GL().programs.end()) {
        call.Error(GL_INVALID_VALUE);
        return nullptr;
    }
    return &found->second;
}

void ShaderSource(GLuint shader, GLsizei count, const GLchar* const* strings, const GLint* lengths)
{
    std::vector<Argument> arguments = {
        Number(shader), Number(count), {lengths == nullptr ? "null" : "lengths", {}}};
    for (GLsizei i = 0; i < count; ++i) {
        std::optional<std::size_t> size;
        if (lengths != nullptr && lengths[i] >= 0)
            size = static_cast<std::size_t>(lengths[i]);
        arguments.push_back({Quoted(strings[i], size), {}});
    }
    const Call call("glShaderSource", arguments);
    if (!call.Over())
        ShaderOf(call, shader);
}

void CompileShader(GLuint shader)
{
    const Call call("glCompileShader", {Number(shader)});
    GLState::Shader* object = call.Over() ? nullptr : ShaderOf(call, shader);
    if (object == nullptr)
        return;
    const Device& device = call.Model();
    const std::optional<std::string>& log =
        object->kind == GL_VERTEX_SHADER ? device.vertexLog : device.fragmentLog;
    object->compiled = !log;
    object->log = log.value_or("");
}

// The length of a log, with the terminating zero; 0 for an empty log.
GLint LogLength(const std::string& log)
{
    return log.empty() ? 0 : static_cast<GLint>(log.size() + 1);
}

void CopyLog(const std::string& log, GLsizei size, GLsizei* length, GLchar* text)
{
    const std::size_t room = size > 0 ? static_cast<std::size_t>(size) - 1 : 0;
    const std::size_t copied = std::min(room, log.size());
    if (size > 0) {
        std::memcpy(text, log.data(), copied);
        text[copied] = '\0';
    }
    if (length != nullptr)
        *length = static_cast<GLsizei>(copied);
}

void GetShaderiv(GLuint shader, GLenum name, GLint* result)
{
    const Call call("glGetShaderiv", {Number(shader), Enum(name)}, Result::Number);
    if (call.effect.returns)
        *result = static_cast<GLint>(call.Answer());
    const GLState::Shader* object = call.Over() ? nullptr : ShaderOf(call, shader);
    if (object == nullptr)
        return;
    switch (name) {
    case GL_COMPILE_STATUS:
        *result = object->compiled ? GL_TRUE : GL_FALSE;
        break;
    case GL_INFO_LOG_LENGTH:
        *result = LogLength(object->log);
        break;
    case GL_SHADER_TYPE:
        *result = static_cast<GLint>(object->kind);
        break;
    default:
        call.Error(GL_INVALID_ENUM);
    }
}

void GetShaderInfoLog(GLuint shader, GLsizei size, GLsizei* length, GLchar* text)
{
    const Call call("glGetShaderInfoLog", {Number(shader), Number(size)});
    const GLState::Shader* object = call.Over() ? nullptr : ShaderOf(call, shader);
    if (object != nullptr)
        CopyLog(object->log, size, length, text);
}

void DeleteShader(GLuint shader)
{
    const Call call("glDeleteShader", {Number(shader)});
    // An attached shader would live until its program is deleted; no call uses it until then.
    if (!call.Over() && shader != 0)
        ShaderOf(call, shader);
}

GLuint CreateProgram()
{
    const Call call("glCreateProgram", {}, Result::Number);
    if (call.Over())
        return static_cast<GLuint>(call.Answer());
    const GLuint id = call.GL().nextID++;
    call.GL().programs[id] = {};
    return id;
}

void AttachShader(GLuint program, GLuint shader)
{
    const Call call("glAttachShader", {Number(program), Number(shader)});
    GLState::Program* object = call.Over() ? nullptr : ProgramOf(call, program);
    if (object != nullptr && ShaderOf(call, shader) != nullptr)
        object->shaders.push_back(shader);
}

void LinkProgram(GLuint program)
{
    const Call call("glLinkProgram", {Number(program)});
    GLState::Program* object = call.Over() ? nullptr : ProgramOf(call, program);
    if (object == nullptr)
        return;
    const bool compiled =
        std::all_of(object->shaders.begin(), object->shaders.end(),
                    [&](GLuint shader) { return call.GL().shaders.at(shader).compiled; });
    object->linked = compiled && !call.Model().linkLog;
    object->log =
        call.Model().linkLog.value_or(compiled ? "" : "an attached shader isn't compiled");
}

void GetProgramiv(GLuint program, GLenum name, GLint* result)
{
    const Call call("glGetProgramiv", {Number(program), Enum(name)}, Result::Number);
    if (call.effect.returns)
        *result = static_cast<GLint>(call.Answer());
    const GLState::Program* object = call.Over() ? nullptr : ProgramOf(call, program);
    if (object == nullptr)
        return;
    switch (name) {
    case GL_LINK_STATUS:
        *result = object->linked ? GL_TRUE : GL_FALSE;
        break;
    case GL_INFO_LOG_LENGTH:
        *result = LogLength(object->log);
        break;
    default:
        call.Error(GL_INVALID_ENUM);
    }
}

void GetProgramInfoLog(GLuint program, GLsizei size, GLsizei* length, GLchar* text)
{
    const Call call("glGetProgramInfoLog", {Number(program), Number(size)});
    const GLState::Program* object = call.Over() ? nullptr : ProgramOf(call, program);
    if (object != nullptr)
        CopyLog(object->log, size, length, text);
}

void DeleteProgram(GLuint program)
{
    const Call call("glDeleteProgram", {Number(program)});
    if (!call.Over() && program != 0 && ProgramOf(call, program) != nullptr)
        call.GL().programs.erase(program);
}

void GenTextures(GLsizei count, GLuint* ids)
{
    const Call call("glGenTextures", {Number(count)}, Result::Number);
    for (GLsizei i = 0; i < count; ++i) {
        ids[i] = call.Over() ? static_cast<GLuint>(call.Answer()) : call.GL().nextID++;
        if (!call.Over())
            call.GL().textures[ids[i]] = false;
    }
}

void BindTexture(GLenum target, GLuint texture)
{
    const Call call("glBindTexture", {Enum(target), Number(texture)});
    if (!call.Over())
        call.GL().boundTexture = texture;
}

void TexParameteri(GLenum target, GLenum name, GLint value)
{
    const Call call("glTexParameteri",
                    {Enum(target), Enum(name), Enum(static_cast<std::uint32_t>(value))});
}

void TexImage2D(GLenum target, GLint level, GLint internalFormat, GLsizei width, GLsizei height,
                GLint border, GLenum format, GLenum type, const void* data)
{
    const Call call("glTexImage2D", {Enum(target),
                                     Number(level),
                                     Enum(static_cast<std::uint32_t>(internalFormat)),
                                     Number(width),
                                     Number(height),
                                     Number(border),
                                     Enum(format),
                                     Enum(type),
                                     {data == nullptr ? "null" : "data", {}}});
    if (call.Over())
        return;
    if (call.GL().boundTexture == 0) {
        call.Error(GL_INVALID_OPERATION);
        return;
    }
    call.GL().textures[call.GL().boundTexture] = true;
}

void GenerateMipmap(GLenum target)
{
    const Call call("glGenerateMipmap", {Enum(target)});
}

std::vector<Argument> IDs(GLsizei count, const GLuint* ids)
{
    std::vector<Argument> arguments = {Number(count)};
    for (GLsizei i = 0; i < count; ++i)
        arguments.push_back(Number(ids[i]));
    return arguments;
}

void DeleteTextures(GLsizei count, const GLuint* ids)
{
    const Call call("glDeleteTextures", IDs(count, ids));
    for (GLsizei i = 0; i < count && !call.Over(); ++i)
        call.GL().textures.erase(ids[i]);
}

void GenFramebuffers(GLsizei count, GLuint* ids)
{
    const Call call("glGenFramebuffers", {Number(count)}, Result::Number);
    for (GLsizei i = 0; i < count; ++i) {
        ids[i] = call.Over() ? static_cast<GLuint>(call.Answer()) : call.GL().nextID++;
        if (!call.Over())
            call.GL().framebuffers[ids[i]] = 0;
    }
}

void BindFramebuffer(GLenum target, GLuint framebuffer)
{
    const Call call("glBindFramebuffer", {Enum(target), Number(framebuffer)});
    if (call.Over())
        return;
    if (framebuffer != 0 && call.GL().framebuffers.count(framebuffer) == 0) {
        call.Error(GL_INVALID_OPERATION);
        return;
    }
    call.GL().boundFramebuffer = framebuffer;
}

void FramebufferTexture2D(GLenum target, GLenum attachment, GLenum textureTarget, GLuint texture,
                          GLint level)
{
    const Call call("glFramebufferTexture2D", {Enum(target), Enum(attachment), Enum(textureTarget),
                                               Number(texture), Number(level)});
    if (call.Over())
        return;
    if (call.GL().boundFramebuffer == 0 || call.GL().textures.count(texture) == 0) {
        call.Error(GL_INVALID_OPERATION);
        return;
    }
    call.GL().framebuffers[call.GL().boundFramebuffer] = texture;
}

GLenum CheckFramebufferStatus(GLenum target)
{
    const Call call("glCheckFramebufferStatus", {Enum(target)}, Result::Number);
    return call.Over() ? static_cast<GLenum>(call.Answer()) : FramebufferStatus(call.GL());
}

void DeleteFramebuffers(GLsizei count, const GLuint* ids)
{
    const Call call("glDeleteFramebuffers", IDs(count, ids));
    for (GLsizei i = 0; i < count && !call.Over(); ++i) {
        call.GL().framebuffers.erase(ids[i]);
        if (call.GL().boundFramebuffer == ids[i])
            call.GL().boundFramebuffer = 0;
    }
}

void Flush()
{
    const Call call("glFlush", {});
}

void Finish()
{
    const Call call("glFinish", {});
}

} // namespace

Entry FindGL(const std::string& name)
{
    static const std::map<std::string, Entry> kEntries = {
        {"glGetString", reinterpret_cast<Entry>(&GetString)},
        {"glGetStringi", reinterpret_cast<Entry>(&GetStringi)},
        {"glGetError", reinterpret_cast<Entry>(&GetError)},
        {"glGetIntegerv", reinterpret_cast<Entry>(&GetIntegerv)},
        {"glGetProgramivARB", reinterpret_cast<Entry>(&GetProgramivARB)},
        {"glClearColor", reinterpret_cast<Entry>(&ClearColor)},
        {"glClear", reinterpret_cast<Entry>(&Clear)},
        {"glCreateShader", reinterpret_cast<Entry>(&CreateShader)},
        {"glShaderSource", reinterpret_cast<Entry>(&ShaderSource)},
        {"glCompileShader", reinterpret_cast<Entry>(&CompileShader)},
        {"glGetShaderiv", reinterpret_cast<Entry>(&GetShaderiv)},
        {"glGetShaderInfoLog", reinterpret_cast<Entry>(&GetShaderInfoLog)},
        {"glDeleteShader", reinterpret_cast<Entry>(&DeleteShader)},
        {"glCreateProgram", reinterpret_cast<Entry>(&CreateProgram)},
        {"glAttachShader", reinterpret_cast<Entry>(&AttachShader)},
        {"glLinkProgram", reinterpret_cast<Entry>(&LinkProgram)},
        {"glGetProgramiv", reinterpret_cast<Entry>(&GetProgramiv)},
        {"glGetProgramInfoLog", reinterpret_cast<Entry>(&GetProgramInfoLog)},
        {"glDeleteProgram", reinterpret_cast<Entry>(&DeleteProgram)},
        {"glGenTextures", reinterpret_cast<Entry>(&GenTextures)},
        {"glBindTexture", reinterpret_cast<Entry>(&BindTexture)},
        {"glTexParameteri", reinterpret_cast<Entry>(&TexParameteri)},
        {"glTexImage2D", reinterpret_cast<Entry>(&TexImage2D)},
        {"glGenerateMipmap", reinterpret_cast<Entry>(&GenerateMipmap)},
        {"glDeleteTextures", reinterpret_cast<Entry>(&DeleteTextures)},
        {"glGenFramebuffers", reinterpret_cast<Entry>(&GenFramebuffers)},
        {"glBindFramebuffer", reinterpret_cast<Entry>(&BindFramebuffer)},
        {"glFramebufferTexture2D", reinterpret_cast<Entry>(&FramebufferTexture2D)},
        {"glCheckFramebufferStatus", reinterpret_cast<Entry>(&CheckFramebufferStatus)},
        {"glDeleteFramebuffers", reinterpret_cast<Entry>(&DeleteFramebuffers)},
        {"glFlush", reinterpret_cast<Entry>(&Flush)},
        {"glFinish", reinterpret_cast<Entry>(&Finish)}};
    const auto found = kEntries.find(name);
    return found == kEntries.end() ? nullptr : found->second;
}

} // namespace scripted
