#include "report/KnownKeys.h"

#include <iterator>

namespace assay_host {

namespace {

constexpr const char* kReportKeys[] = {
    "Tester",    "assayStart", "QGFCoreInitialized", "QGFOGLInitialized", "OGLContextCreated",
    "NumGLGPUs", "NumCLGPUs",  "assayEnd",
};

// clang-format off
constexpr KnownKey kOpenGLKeys[] = {
    {"GLVersion", "OpenGL version", ValueForm::kText, KeyGroup::kMain},
    {"IsIntegratedGLGPU", "Integrated", ValueForm::kFlag, KeyGroup::kMain},
    {"GLMemoryMB", "Memory", ValueForm::kMebibytes, KeyGroup::kMain},
    {"GLName", "Adapter", ValueForm::kAdapter, KeyGroup::kMain},
    {"GLVendor", "Vendor", ValueForm::kText, KeyGroup::kMain},
    {"GLVendorID", "Vendor id", ValueForm::kId, KeyGroup::kMain},
    {"GLDriverVersion", "Driver version", ValueForm::kText, KeyGroup::kMain},
    {"GLRectTextureSize", "Largest rectangle", ValueForm::kTexels, KeyGroup::kMain},
    {"GLRenderer", "Renderer", ValueForm::kText, KeyGroup::kMain},
    {"GLRendererID", "Device id", ValueForm::kId, KeyGroup::kMain},
    {"HasGLNPOTSupport", "Textures of any size", ValueForm::kFlag, KeyGroup::kMain},
    {"GLDriver", "Driver", ValueForm::kText, KeyGroup::kMain},
    {"GLDriverDate", "Driver date", ValueForm::kDate, KeyGroup::kMain},
    {"CanCompileProgramGLSL", "Shaders compile", ValueForm::kFlag, KeyGroup::kMain},
    {"GLFrameBufferOK", "Framebuffers work", ValueForm::kFlag, KeyGroup::kMain},
    {"glGetString[GL_SHADING_LANGUAGE_VERSION]", "Shading language", ValueForm::kText,
     KeyGroup::kMain},
    {"glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][GL_MAX_PROGRAM_INSTRUCTIONS_ARB]",
     "Program instructions", ValueForm::kCount, KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_TEXTURE_UNITS]", "Texture units", ValueForm::kCount, KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS]", "Combined image units",
     ValueForm::kCount, KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS]", "Vertex image units", ValueForm::kCount,
     KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_TEXTURE_IMAGE_UNITS]", "Fragment image units", ValueForm::kCount,
     KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_DRAW_BUFFERS]", "Draw buffers", ValueForm::kCount, KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_VERTEX_UNIFORM_COMPONENTS]", "Vertex uniforms", ValueForm::kCount,
     KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_FRAGMENT_UNIFORM_COMPONENTS]", "Fragment uniforms", ValueForm::kCount,
     KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_VARYING_FLOATS]", "Varying floats", ValueForm::kCount,
     KeyGroup::kLimit},
    {"glGetIntegerv[GL_MAX_VERTEX_ATTRIBS]", "Vertex attributes", ValueForm::kCount,
     KeyGroup::kLimit},
    {"extension[QGF::OGL::GL_ARB_VERTEX_PROGRAM]", "GL_ARB_vertex_program", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_PROGRAM]", "GL_ARB_fragment_program", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_VERTEX_SHADER]", "GL_ARB_vertex_shader", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_SHADER]", "GL_ARB_fragment_shader", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT]", "GL_EXT_framebuffer_object",
     ValueForm::kFlag, KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_RECTANGLE]", "GL_ARB_texture_rectangle",
     ValueForm::kFlag, KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_FLOAT]", "GL_ARB_texture_float", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_OCCLUSION_QUERY]", "GL_ARB_occlusion_query", ValueForm::kFlag,
     KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT]", "GL_ARB_vertex_buffer_object",
     ValueForm::kFlag, KeyGroup::kExtension},
    {"extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]", "GL_ARB_shader_texture_lod",
     ValueForm::kFlag, KeyGroup::kExtension},
};

constexpr KnownKey kOpenCLKeys[] = {
    {"CLPlatformVersion", "Platform version", ValueForm::kText, KeyGroup::kMain},
    {"CLDeviceVersion", "OpenCL version", ValueForm::kText, KeyGroup::kMain},
    {"IsIntegratedCLGPU", "Integrated", ValueForm::kFlag, KeyGroup::kMain},
    {"CLMemoryMB", "Memory", ValueForm::kMebibytes, KeyGroup::kMain},
    {"CLName", "Name", ValueForm::kText, KeyGroup::kMain},
    {"CLVendor", "Vendor", ValueForm::kText, KeyGroup::kMain},
    {"CLVendorID", "Vendor id", ValueForm::kId, KeyGroup::kMain},
    {"CLDriverVersion", "Driver version", ValueForm::kText, KeyGroup::kMain},
    {"CUDASupported", "CUDA", ValueForm::kFlag, KeyGroup::kMain},
    {"CUDAVersion", "CUDA version", ValueForm::kText, KeyGroup::kMain},
    {"CLBandwidth", "Copy bandwidth", ValueForm::kBytesPerSecond, KeyGroup::kMain},
    {"CLCompute", "Compute score", ValueForm::kScore, KeyGroup::kMain},
};
// clang-format on

} // namespace

const char* GetKindName(DeviceKind kind)
{
    return kind == DeviceKind::kOpenGL ? "OpenGL" : "OpenCL";
}

const char* GetTagWord(DeviceKind kind)
{
    return kind == DeviceKind::kOpenGL ? "glgpu" : "clgpu";
}

const char* GetCountKey(DeviceKind kind)
{
    return kind == DeviceKind::kOpenGL ? "NumGLGPUs" : "NumCLGPUs";
}

Table<KnownKey> GetDeviceKeys(DeviceKind kind)
{
    if (kind == DeviceKind::kOpenGL)
        return {kOpenGLKeys, std::size(kOpenGLKeys)};
    return {kOpenCLKeys, std::size(kOpenCLKeys)};
}

Table<const char*> GetReportKeys()
{
    return {kReportKeys, std::size(kReportKeys)};
}

} // namespace assay_host
