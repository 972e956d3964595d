#include <algorithm>
#include <string>

#include "qgf/OGL.h"
#include "qgf/qgf_ogl/OpenGLConstants.h"

namespace QGF {
namespace OGL {

namespace {

constexpr char kSourceFile[] = "qgf/source/qgf/qgf_ogl/Program";

// Bytes. Guards against a driver that reports a huge length.
constexpr std::int32_t kMaxLogLength = 64 * 1024;

// Joins the lines of a driver's log by " | ", since a failure text is one line.
std::string JoinLines(const std::string& log)
{
    std::string line;
    bool pending = false;
    for (const char character : log) {
        if (character == '\n' || character == '\r') {
            pending = true;
            continue;
        }
        if (pending)
            line += " | ";
        pending = false;
        line += character;
    }
    return line;
}

// `getLog(size, &written, text)` calls the driver. `written` isn't used: a driver may set it to any
// value.
template <typename GetLog>
std::string DriverLog(std::int32_t length, GetLog getLog)
{
    if (length > 1) {
        const std::int32_t size = std::min(length, kMaxLogLength);
        // One byte more than the driver is allowed to write, so that the text is zero-terminated.
        std::string log(static_cast<std::size_t>(size) + 1, '\0');
        std::int32_t written = 0;
        getLog(size, &written, log.data());
        log.resize(log.find('\0'));
        const std::size_t end = log.find_last_not_of("\r\n\t ");
        log.resize(end == std::string::npos ? 0 : end + 1);
        if (!log.empty())
            return JoinLines(log);
    }
    return "the driver returns no log";
}

// Deletes a shader at the end of the scope. OpenGL keeps an attached shader until its program is
// deleted.
class ScopedShader {
public:
    ScopedShader(const OpenGLInterceptor& gl, std::uint32_t id) : fGL(gl), fID(id) {}
    ~ScopedShader()
    {
        try {
            fGL.glDeleteShader(kSourceFile, __LINE__, fID);
        } catch (...) {
            // The shader is freed with its context.
        }
    }
    ScopedShader(const ScopedShader&) = delete;
    ScopedShader& operator=(const ScopedShader&) = delete;

private:
    const OpenGLInterceptor& fGL;
    std::uint32_t fID;
};

} // namespace

Program::Program() : fProgram(OpenGLInterceptor::Instance().glCreateProgram(kSourceFile, __LINE__))
{
    if (fProgram == 0)
        throw LogicalException("glCreateProgram returned no program");
}

Program::~Program()
{
    try {
        OpenGLInterceptor::Instance().glDeleteProgram(kSourceFile, __LINE__, fProgram);
    } catch (...) {
        // The program is freed with its context.
    }
}

void Program::loadVertexShader(int count, const char* const* strings, const std::int32_t* lengths)
{
    LoadShader(kGLVertexShader, "vertex", count, strings, lengths);
    fHasVertexShader = true;
}

void Program::loadFragmentShader(int count, const char* const* strings, const std::int32_t* lengths)
{
    LoadShader(kGLFragmentShader, "fragment", count, strings, lengths);
    fHasFragmentShader = true;
}

void Program::LoadShader(std::uint32_t kind, const char* kindName, int count,
                         const char* const* strings, const std::int32_t* lengths)
{
    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    const std::uint32_t shader = gl.glCreateShader(kSourceFile, __LINE__, kind);
    if (shader == 0)
        throw LogicalException(std::string("glCreateShader returned no ") + kindName + " shader");
    const ScopedShader scope(gl, shader);

    gl.glShaderSource(kSourceFile, __LINE__, shader, count, strings, lengths);
    gl.glCompileShader(kSourceFile, __LINE__, shader);
    std::int32_t compiled = kGLFalse;
    gl.glGetShaderiv(kSourceFile, __LINE__, shader, kGLCompileStatus, &compiled);
    if (compiled == kGLFalse) {
        std::int32_t length = 0;
        gl.glGetShaderiv(kSourceFile, __LINE__, shader, kGLInfoLogLength, &length);
        throw LogicalException(
            std::string("The ") + kindName + " shader doesn't compile: " +
            DriverLog(length, [&](std::int32_t size, std::int32_t* written, char* text) {
                gl.glGetShaderInfoLog(kSourceFile, __LINE__, shader, size, written, text);
            }));
    }
    gl.glAttachShader(kSourceFile, __LINE__, fProgram, shader);
}

void Program::link(bool requireShaders)
{
    if (requireShaders && !(fHasVertexShader && fHasFragmentShader))
        throw LogicalException(std::string("The program has no ") +
                               (fHasVertexShader ? "fragment" : "vertex") + " shader to link");

    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    gl.glLinkProgram(kSourceFile, __LINE__, fProgram);
    std::int32_t linked = kGLFalse;
    gl.glGetProgramiv(kSourceFile, __LINE__, fProgram, kGLLinkStatus, &linked);
    if (linked == kGLFalse) {
        std::int32_t length = 0;
        gl.glGetProgramiv(kSourceFile, __LINE__, fProgram, kGLInfoLogLength, &length);
        throw LogicalException(
            "The program doesn't link: " +
            DriverLog(length, [&](std::int32_t size, std::int32_t* written, char* text) {
                gl.glGetProgramInfoLog(kSourceFile, __LINE__, fProgram, size, written, text);
            }));
    }
}

} // namespace OGL
} // namespace QGF
