#include "qgf/qgf_ogl/OpenGLTable.h"

namespace QGF {
namespace OGL {

void FillOpenGLTable(OpenGLTable& table, OpenGLInterceptor::GetProc getProc, void* context)
{
    const auto fill = [getProc, context](auto& member, const char* name,
                                         const char* extensionName = nullptr) {
        Core::Proc proc = getProc(context, name);
        if (proc == nullptr && extensionName != nullptr)
            proc = getProc(context, extensionName);
        member = reinterpret_cast<std::remove_reference_t<decltype(member)>>(proc);
    };

    fill(table.glGetString, "glGetString");
    fill(table.glGetStringi, "glGetStringi");
    fill(table.glGetError, "glGetError");
    fill(table.glGetIntegerv, "glGetIntegerv");
    fill(table.glGetProgramivARB, "glGetProgramivARB");
    fill(table.glClearColor, "glClearColor");
    fill(table.glClear, "glClear");

    fill(table.glCreateShader, "glCreateShader");
    fill(table.glShaderSource, "glShaderSource");
    fill(table.glCompileShader, "glCompileShader");
    fill(table.glGetShaderiv, "glGetShaderiv");
    fill(table.glGetShaderInfoLog, "glGetShaderInfoLog");
    fill(table.glDeleteShader, "glDeleteShader");
    fill(table.glCreateProgram, "glCreateProgram");
    fill(table.glAttachShader, "glAttachShader");
    fill(table.glLinkProgram, "glLinkProgram");
    fill(table.glGetProgramiv, "glGetProgramiv");
    fill(table.glGetProgramInfoLog, "glGetProgramInfoLog");
    fill(table.glDeleteProgram, "glDeleteProgram");

    fill(table.glGenTextures, "glGenTextures");
    fill(table.glBindTexture, "glBindTexture");
    fill(table.glTexParameteri, "glTexParameteri");
    fill(table.glTexImage2D, "glTexImage2D");
    fill(table.glGenerateMipmap, "glGenerateMipmap", "glGenerateMipmapEXT");
    fill(table.glDeleteTextures, "glDeleteTextures");

    // The extension's functions do the same for everything that the library does with them.
    fill(table.glGenFramebuffers, "glGenFramebuffers", "glGenFramebuffersEXT");
    fill(table.glBindFramebuffer, "glBindFramebuffer", "glBindFramebufferEXT");
    fill(table.glFramebufferTexture2D, "glFramebufferTexture2D", "glFramebufferTexture2DEXT");
    fill(table.glCheckFramebufferStatus, "glCheckFramebufferStatus", "glCheckFramebufferStatusEXT");
    fill(table.glDeleteFramebuffers, "glDeleteFramebuffers", "glDeleteFramebuffersEXT");
}

} // namespace OGL
} // namespace QGF
