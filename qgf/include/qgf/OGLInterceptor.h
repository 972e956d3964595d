// The call table and the extensions of an OpenGL context.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "qgf/OGLEntryPoint.h"

namespace QGF {
namespace OGL {

// The call table of one context. Each call takes the caller's source file and line, then OpenGL's
// arguments. A call whose entry point the driver lacks throws LogicalException "NAME is not offered
// by this OpenGL driver (called from FILE:LINE)"; glGetStringi returns null instead.
class OpenGLInterceptor {
    // The first member: the constructors of the entry points use it.
    const EntryPointLookup fLookup;

public:
    // Looks the entry points up with `getProc`; `getProc(context, name)` may return null.
    using GetProc = decltype(EntryPointLookup::getProc);
    OpenGLInterceptor(GetProc getProc, void* context);
    OpenGLInterceptor(const OpenGLInterceptor&) = delete;
    OpenGLInterceptor& operator=(const OpenGLInterceptor&) = delete;

    // The table of the context that is current on this thread. Throws if there is none.
    static const OpenGLInterceptor& Instance();

// The entry points: name and type. _OR_EXT falls back to the extension's name, which ends in "EXT",
// if the driver lacks the core function; _OR_NULL makes an OptionalEntryPoint.
#define QGF_OGL_FUNCTION(name, type) const EntryPoint<type> name = {fLookup, #name}
#define QGF_OGL_FUNCTION_OR_EXT(name, type)                                                        \
    const EntryPoint<type> name = {fLookup, #name, #name "EXT"}
#define QGF_OGL_FUNCTION_OR_NULL(name, type) const OptionalEntryPoint<type> name = {fLookup, #name}

    QGF_OGL_FUNCTION(glGetString, const GLubyte*(GLenum name));
    QGF_OGL_FUNCTION_OR_NULL(glGetStringi, const GLubyte*(GLenum name, GLuint index));
    QGF_OGL_FUNCTION(glGetError, GLenum());
    QGF_OGL_FUNCTION(glGetIntegerv, void(GLenum name, GLint* result));
    QGF_OGL_FUNCTION(glGetProgramivARB, void(GLenum target, GLenum code, GLint* result));
    QGF_OGL_FUNCTION(glClearColor, void(GLfloat red, GLfloat green, GLfloat blue, GLfloat alpha));
    QGF_OGL_FUNCTION(glClear, void(GLbitfield mask));

    QGF_OGL_FUNCTION(glCreateShader, GLuint(GLenum kind));
    QGF_OGL_FUNCTION(glShaderSource, void(GLuint shader, GLsizei count,
                                          const GLchar* const* strings, const GLint* lengths));
    QGF_OGL_FUNCTION(glCompileShader, void(GLuint shader));
    QGF_OGL_FUNCTION(glGetShaderiv, void(GLuint shader, GLenum name, GLint* result));
    QGF_OGL_FUNCTION(glGetShaderInfoLog,
                     void(GLuint shader, GLsizei size, GLsizei* length, GLchar* text));
    QGF_OGL_FUNCTION(glDeleteShader, void(GLuint shader));
    QGF_OGL_FUNCTION(glCreateProgram, GLuint());
    QGF_OGL_FUNCTION(glAttachShader, void(GLuint program, GLuint shader));
    QGF_OGL_FUNCTION(glLinkProgram, void(GLuint program));
    QGF_OGL_FUNCTION(glGetProgramiv, void(GLuint program, GLenum name, GLint* result));
    QGF_OGL_FUNCTION(glGetProgramInfoLog,
                     void(GLuint program, GLsizei size, GLsizei* length, GLchar* text));
    QGF_OGL_FUNCTION(glDeleteProgram, void(GLuint program));

    QGF_OGL_FUNCTION(glGenTextures, void(GLsizei count, GLuint* ids));
    QGF_OGL_FUNCTION(glBindTexture, void(GLenum target, GLuint id));
    QGF_OGL_FUNCTION(glTexParameteri, void(GLenum target, GLenum name, GLint value));
    QGF_OGL_FUNCTION(glTexImage2D, void(GLenum target, GLint level, GLint internalFormat,
                                        GLsizei width, GLsizei height, GLint border, GLenum format,
                                        GLenum type, const void* data));
    QGF_OGL_FUNCTION_OR_EXT(glGenerateMipmap, void(GLenum target));
    QGF_OGL_FUNCTION(glDeleteTextures, void(GLsizei count, const GLuint* ids));

    QGF_OGL_FUNCTION_OR_EXT(glGenFramebuffers, void(GLsizei count, GLuint* ids));
    QGF_OGL_FUNCTION_OR_EXT(glBindFramebuffer, void(GLenum target, GLuint id));
    QGF_OGL_FUNCTION_OR_EXT(glFramebufferTexture2D,
                            void(GLenum target, GLenum attachment, GLenum textureTarget,
                                 GLuint texture, GLint level));
    QGF_OGL_FUNCTION_OR_EXT(glCheckFramebufferStatus, GLenum(GLenum target));
    QGF_OGL_FUNCTION_OR_EXT(glDeleteFramebuffers, void(GLsizei count, const GLuint* ids));

#undef QGF_OGL_FUNCTION
#undef QGF_OGL_FUNCTION_OR_EXT
#undef QGF_OGL_FUNCTION_OR_NULL
};

// Core versions and extensions. The values are the library's own.
enum OpenGLExtension : std::int32_t {
    GL_VERSION_1_2 = 0,
    GL_IMAGING_1_2 = 1, // the optional imaging subset
    GL_VERSION_1_3 = 2,
    GL_VERSION_1_4 = 3,
    GL_VERSION_1_5 = 4,
    GL_VERSION_2_0 = 5,
    GL_VERSION_2_1 = 6,
    GL_VERSION_3_0 = 7,
    GL_VERSION_3_1 = 8,
    GL_VERSION_3_2 = 9,
    GL_VERSION_3_3 = 10,
    GL_VERSION_4_0 = 11,
    GL_VERSION_4_1 = 12,
    GL_ARB_FRAGMENT_PROGRAM = 27,
    GL_ARB_FRAGMENT_SHADER = 28,
    GL_ARB_OCCLUSION_QUERY = 37,
    GL_ARB_SHADER_TEXTURE_LOD = 47,
    GL_ARB_TEXTURE_FLOAT = 53,
    GL_ARB_TEXTURE_NON_POWER_OF_TWO = 56,
    GL_ARB_TEXTURE_RECTANGLE = 58,
    GL_ARB_VERTEX_BUFFER_OBJECT = 68,
    GL_ARB_VERTEX_PROGRAM = 69,
    GL_ARB_VERTEX_SHADER = 70,
    GL_EXT_FRAMEBUFFER_OBJECT = 81,
};

// The version and extensions of one context.
class ExtensionManager {
public:
    // The manager of the context that is current on this thread; null if there is none.
    static ExtensionManager* Instance();

    // Reads version and extension names with the calls of the current context.
    explicit ExtensionManager(const OpenGLInterceptor& gl);

    // Returns whether the context has this core version or a later one, or this extension. Returns
    // false for an unknown value.
    bool isSupported(OpenGLExtension extension) const;

private:
    int fMajor = 0;
    int fMinor = 0;
    std::vector<std::string> fNames; // sorted
};

} // namespace OGL
} // namespace QGF
