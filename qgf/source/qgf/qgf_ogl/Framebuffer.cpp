#include <algorithm>
#include <cstdio>
#include <iterator>
#include <limits>

#include "qgf/OGL.h"
#include "qgf/qgf_ogl/OpenGLConstants.h"

namespace QGF {
namespace OGL {

namespace {

constexpr char kSourceFile[] = "qgf/source/qgf/qgf_ogl/Framebuffer";

// OpenGL defines GL_COLOR_ATTACHMENT0 to GL_COLOR_ATTACHMENT31.
constexpr std::uint32_t kMaxColorAttachments = 32;

struct StatusName {
    std::uint32_t status;
    const char* name;
};

constexpr StatusName kStatusNames[] = {
    {0x8219, "GL_FRAMEBUFFER_UNDEFINED"},
    {0x8CD6, "GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT"},
    {0x8CD7, "GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT"},
    {0x8CD9, "GL_FRAMEBUFFER_INCOMPLETE_DIMENSIONS"},
    {0x8CDA, "GL_FRAMEBUFFER_INCOMPLETE_FORMATS"},
    {0x8CDB, "GL_FRAMEBUFFER_INCOMPLETE_DRAW_BUFFER"},
    {0x8CDC, "GL_FRAMEBUFFER_INCOMPLETE_READ_BUFFER"},
    {0x8CDD, "GL_FRAMEBUFFER_UNSUPPORTED"},
    {0x8D56, "GL_FRAMEBUFFER_INCOMPLETE_MULTISAMPLE"},
};

std::string HexText(std::uint32_t number)
{
    char text[16];
    std::snprintf(text, sizeof text, "0x%04X", number);
    return text;
}

std::string StatusText(std::uint32_t status)
{
    const auto* const row =
        std::find_if(std::begin(kStatusNames), std::end(kStatusNames),
                     [status](const StatusName& candidate) { return candidate.status == status; });
    return row != std::end(kStatusNames) ? row->name : HexText(status);
}

// Reads one error from OpenGL's queue, so that the caller's next glGetError doesn't return it. Most
// often the texture raised it: Texture2D doesn't call glGetError.
std::string ErrorText(const OpenGLInterceptor& gl)
{
    const std::uint32_t error = gl.glGetError(kSourceFile, __LINE__);
    return error != kGLNoError ? ", after OpenGL error " + HexText(error) : "";
}

} // namespace

Framebuffer::Framebuffer()
{
    OpenGLInterceptor::Instance().glGenFramebuffers(kSourceFile, __LINE__, 1, &fFramebuffer);
    if (fFramebuffer == 0)
        throw LogicalException("glGenFramebuffers returned no framebuffer");
}

Framebuffer::~Framebuffer()
{
    try {
        OpenGLInterceptor::Instance().glDeleteFramebuffers(kSourceFile, __LINE__, 1, &fFramebuffer);
    } catch (...) {
        // The framebuffer is freed with its context.
    }
}

void Framebuffer::bind()
{
    OpenGLInterceptor::Instance().glBindFramebuffer(kSourceFile, __LINE__, kGLFramebuffer,
                                                    fFramebuffer);
}

void Framebuffer::unbind()
{
    OpenGLInterceptor::Instance().glBindFramebuffer(kSourceFile, __LINE__, kGLFramebuffer, 0);
}

void Framebuffer::attach(const Texture2D& texture, std::uint32_t attachment, std::uint32_t level)
{
    if (attachment >= kMaxColorAttachments)
        throw LogicalException("There is no colour attachment " + std::to_string(attachment));
    if (level > static_cast<std::uint32_t>(std::numeric_limits<std::int32_t>::max()))
        throw LogicalException("There is no texture level " + std::to_string(level));

    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    gl.glFramebufferTexture2D(kSourceFile, __LINE__, kGLFramebuffer,
                              kGLColorAttachment0 + attachment, kGLTexture2D, texture.id(),
                              static_cast<std::int32_t>(level));
    const std::uint32_t status = gl.glCheckFramebufferStatus(kSourceFile, __LINE__, kGLFramebuffer);
    if (status != kGLFramebufferComplete)
        throw LogicalException("The framebuffer is not complete: " + StatusText(status) +
                               ErrorText(gl));
}

} // namespace OGL
} // namespace QGF
