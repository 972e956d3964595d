#include <algorithm>
#include <iterator>

#include "qgf/OGL.h"
#include "qgf/qgf_ogl/OpenGLConstants.h"

namespace QGF {
namespace OGL {

namespace {

constexpr char kSourceFile[] = "qgf/source/qgf/qgf_ogl/Texture2D";

struct FormatRow {
    InternalFormat format;
    std::int32_t internalFormat;
    std::uint32_t dataFormat;
    std::uint32_t defaultType;
};

constexpr FormatRow kFormats[] = {
    {InternalFormat::RGBA8, kGLRGBA8, kGLRGBA, kGLUnsignedByte},
};

const FormatRow& FindFormat(InternalFormat format)
{
    const auto* const row =
        std::find_if(std::begin(kFormats), std::end(kFormats),
                     [format](const FormatRow& candidate) { return candidate.format == format; });
    if (row == std::end(kFormats))
        throw LogicalException("Unknown texture format " +
                               std::to_string(static_cast<std::int32_t>(format)));
    return *row;
}

} // namespace

Texture2D::Texture2D()
{
    OpenGLInterceptor::Instance().glGenTextures(kSourceFile, __LINE__, 1, &fTexture);
    if (fTexture == 0)
        throw LogicalException("glGenTextures returned no texture");
}

Texture2D::Texture2D(InternalFormat format, std::int32_t width, std::int32_t height, bool mipmaps,
                     const void* data, Type type)
    : Texture2D()
{
    const FormatRow& row = FindFormat(format);
    if (type != Type::Default)
        throw LogicalException("Unknown texture data type " +
                               std::to_string(static_cast<std::int32_t>(type)));
    if (width <= 0 || height <= 0)
        throw LogicalException("Bad texture size " + std::to_string(width) + " x " +
                               std::to_string(height));

    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    gl.glBindTexture(kSourceFile, __LINE__, kGLTexture2D, fTexture);
    // OpenGL's default filter needs all levels: a texture with one level would be incomplete.
    gl.glTexParameteri(kSourceFile, __LINE__, kGLTexture2D, kGLTextureMinFilter,
                       mipmaps ? kGLLinearMipmapLinear : kGLLinear);
    gl.glTexImage2D(kSourceFile, __LINE__, kGLTexture2D, 0, row.internalFormat, width, height, 0,
                    row.dataFormat, row.defaultType, data);
    if (mipmaps)
        gl.glGenerateMipmap(kSourceFile, __LINE__, kGLTexture2D);
    gl.glBindTexture(kSourceFile, __LINE__, kGLTexture2D, 0);
}

Texture2D::~Texture2D()
{
    try {
        OpenGLInterceptor::Instance().glDeleteTextures(kSourceFile, __LINE__, 1, &fTexture);
    } catch (...) {
        // The texture is freed with its context.
    }
}

} // namespace OGL
} // namespace QGF
