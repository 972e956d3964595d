#include "supervise/TestSequence.h"

#include <fmt/format.h>

namespace assay_host {

namespace {

using Form = Test::Form;

constexpr char kProgramTarget[] = "GL_FRAGMENT_PROGRAM_ARB";
constexpr int kProgramTargetCode = 34820;

constexpr Test Key(const char* name, Match match = Match::kExact, bool maybeSilent = false)
{
    return {Form::kKey, name, 0, match, maybeSilent};
}

constexpr Test Query(Form form, const char* name, int code)
{
    return {form, name, code, Match::kExact, false};
}

} // namespace

std::string Test::GetKey(const std::string& tag) const
{
    switch (fForm) {
    case Form::kString:
        return fmt::format("{}.glGetString[{}]", tag, fName);
    case Form::kIntegers:
        return fmt::format("{}.glGetIntegerv[{}]", tag, fName);
    case Form::kProgram:
        return fmt::format("{}.glGetProgramivARB[{}][{}]", tag, kProgramTarget, fName);
    case Form::kExtension:
        return fmt::format("{}.extension[{}]", tag, fName);
    default:
        return fmt::format("{}.{}", tag, fName);
    }
}

std::vector<std::string> Test::GetTagLines() const
{
    std::vector<std::string> lines;
    if (fForm == Form::kProgram)
        lines.push_back(fmt::format("gputag.{}={}", kProgramTarget, kProgramTargetCode));
    if (fForm != Form::kKey)
        lines.push_back(fmt::format("gputag.{}={}", fName, fCode));
    return lines;
}

const std::vector<Test>& GetGLTests()
{
    static const std::vector<Test> tests = {
        Key("GLVersion"),
        Key("IsIntegratedGLGPU"),
        Key("GLMemoryMB", Match::kInteger),
        Key("GLName"),
        Key("GLVendor"),
        Key("GLVendorID"),
        Key("GLDriverVersion"),
        Key("GLRectTextureSize"),
        Key("GLRenderer"),
        Key("GLRendererID"),
        Key("HasGLNPOTSupport"),
        Key("GLDriver"),
        Key("GLDriverDate"),
        Key("CanCompileProgramGLSL"),
        Key("GLFrameBufferOK"),
        Query(Form::kString, "GL_SHADING_LANGUAGE_VERSION", 35724),
        Query(Form::kProgram, "GL_MAX_PROGRAM_INSTRUCTIONS_ARB", 34977),
        Query(Form::kIntegers, "GL_MAX_TEXTURE_UNITS", 34018),
        Query(Form::kIntegers, "GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", 35661),
        Query(Form::kIntegers, "GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS", 35660),
        Query(Form::kIntegers, "GL_MAX_TEXTURE_IMAGE_UNITS", 34930),
        Query(Form::kIntegers, "GL_MAX_DRAW_BUFFERS", 34852),
        Query(Form::kIntegers, "GL_MAX_VERTEX_UNIFORM_COMPONENTS", 35658),
        Query(Form::kIntegers, "GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", 35657),
        Query(Form::kIntegers, "GL_MAX_VARYING_FLOATS", 35659),
        Query(Form::kIntegers, "GL_MAX_VERTEX_ATTRIBS", 34921),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_VERTEX_PROGRAM", 69),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_FRAGMENT_PROGRAM", 27),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_VERTEX_SHADER", 70),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_FRAGMENT_SHADER", 28),
        Query(Form::kExtension, "QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT", 81),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_TEXTURE_RECTANGLE", 58),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_TEXTURE_FLOAT", 53),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_OCCLUSION_QUERY", 37),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT", 68),
        Query(Form::kExtension, "QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD", 47),
    };
    return tests;
}

const std::vector<Test>& GetCLTests()
{
    static const std::vector<Test> tests = {
        Key("CLPlatformVersion"),
        Key("CLDeviceVersion"),
        Key("IsIntegratedCLGPU"),
        Key("CLMemoryMB", Match::kInteger),
        Key("CLName"),
        Key("CLVendor"),
        Key("CLVendorID"),
        Key("CLDriverVersion"),
        Key("CUDASupported"),
        Key("CUDAVersion", Match::kExact, true),
        Key("CLBandwidth", Match::kNumber),
        Key("CLCompute", Match::kNumber),
    };
    return tests;
}

std::string MakeGLTag(std::size_t index)
{
    return fmt::format("glgpu[{}]", index);
}

std::string MakeCLTag(std::size_t index)
{
    return fmt::format("clgpu[{}]", index);
}

const std::vector<GlobalKey>& GetFirstKeys()
{
    static const std::vector<GlobalKey> keys = {
        {"Tester", Match::kExact},
        {"assayStart", Match::kStamp},
        {"QGFCoreInitialized", Match::kExact},
        {"QGFOGLInitialized", Match::kExact},
        {"OGLContextCreated", Match::kExact},
        {kGLCountKey, Match::kExact},
    };
    return keys;
}

} // namespace assay_host
