// The OpenGL constants that the library uses. The Khronos headers aren't included, because they
// define macros with the names of OpenGLExtension's members.
#pragma once

#include <cstdint>

namespace QGF {
namespace OGL {

constexpr std::uint32_t kGLFalse = 0;
constexpr std::uint32_t kGLNoError = 0;
constexpr std::uint32_t kGLVersion = 0x1F02;
constexpr std::uint32_t kGLExtensions = 0x1F03;
constexpr std::uint32_t kGLNumExtensions = 0x821D;

constexpr std::uint32_t kGLFragmentShader = 0x8B30;
constexpr std::uint32_t kGLVertexShader = 0x8B31;
constexpr std::uint32_t kGLCompileStatus = 0x8B81;
constexpr std::uint32_t kGLLinkStatus = 0x8B82;
constexpr std::uint32_t kGLInfoLogLength = 0x8B84;

constexpr std::uint32_t kGLTexture2D = 0x0DE1;
constexpr std::uint32_t kGLTextureMinFilter = 0x2801;
constexpr std::int32_t kGLLinear = 0x2601;
constexpr std::int32_t kGLLinearMipmapLinear = 0x2703;
constexpr std::uint32_t kGLRGBA = 0x1908;
constexpr std::int32_t kGLRGBA8 = 0x8058;
constexpr std::uint32_t kGLUnsignedByte = 0x1401;

constexpr std::uint32_t kGLFramebuffer = 0x8D40;
constexpr std::uint32_t kGLColorAttachment0 = 0x8CE0;
constexpr std::uint32_t kGLFramebufferComplete = 0x8CD5;

} // namespace OGL
} // namespace QGF
