#include "report/KnownKeys.h"

#include <algorithm>
#include <unordered_map>
#include <utility>

#include <fmt/format.h>

namespace assay_host {

namespace {

constexpr DeviceKind kGL = DeviceKind::kOpenGL;
constexpr DeviceKind kCL = DeviceKind::kOpenCL;

KnownKey ReportKey(const char* name, Match match = Match::kExact)
{
    KnownKey key;
    key.fKey = name;
    key.fMatch = match;
    return key;
}

KnownKey ReportFlag(const char* name)
{
    KnownKey key = ReportKey(name);
    key.fForm = ValueForm::kFlag;
    return key;
}

KnownKey DeviceKey(DeviceKind kind, int row, const char* name, const char* label, ValueForm form,
                   Match match = Match::kExact, const char* silentWithout = "")
{
    KnownKey key;
    key.fKind = kind;
    key.fKey = name;
    key.fLabel = label;
    key.fForm = form;
    key.fRow = row;
    key.fMatch = match;
    key.fSilentWithout = silentWithout;
    return key;
}

KnownKey ByAdapter(KnownKey key)
{
    key.fNeedsAdapter = true;
    return key;
}

KnownKey Query(std::string text, const char* name, int code, const char* label)
{
    KnownKey key;
    key.fKind = kGL;
    key.fKey = std::move(text);
    key.fLabel = label;
    key.fTagLines = {fmt::format("gputag.{}={}", name, code)};
    key.fTagsFirst = true;
    return key;
}

// TAG.glGetString[NAME]="text", and no step.
KnownKey String(int row, const char* name, int code, const char* label)
{
    KnownKey key = Query(fmt::format("glGetString[{}]", name), name, code, label);
    key.fRow = row;
    key.fTakesStep = false;
    return key;
}

// TAG.glGetIntegerv[NAME]=[n]
KnownKey Integers(const char* name, int code, const char* label)
{
    KnownKey key = Query(fmt::format("glGetIntegerv[{}]", name), name, code, label);
    key.fForm = ValueForm::kCount;
    key.fGroup = KeyGroup::kLimit;
    key.fTagsFirst = false;
    return key;
}

// TAG.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][NAME]=[n]
KnownKey Program(const char* name, int code, const char* label)
{
    KnownKey key = Query(fmt::format("glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][{}]", name), name,
                         code, label);
    key.fForm = ValueForm::kCount;
    key.fGroup = KeyGroup::kLimit;
    key.fTagLines.insert(key.fTagLines.begin(), "gputag.GL_FRAGMENT_PROGRAM_ARB=34820");
    return key;
}

// TAG.extension[QGF::OGL::NAME]=0 or 1
KnownKey Extension(const char* name, int code, const char* label)
{
    const std::string fullName = fmt::format("QGF::OGL::{}", name);
    KnownKey key = Query(fmt::format("extension[{}]", fullName), fullName.c_str(), code, label);
    key.fForm = ValueForm::kFlag;
    key.fGroup = KeyGroup::kExtension;
    return key;
}

std::vector<KnownKey> MakeKnownKeys()
{
    using Form = ValueForm;
    return {
        ReportKey("Tester"),
        ReportKey("assayStart", Match::kStamp),
        ReportFlag("QGFCoreInitialized"),
        ReportFlag("QGFOGLInitialized"),
        ReportFlag("OGLContextCreated"),

        ReportKey(GetCountKey(kGL)),
        DeviceKey(kGL, 8, "GLVersion", "OpenGL version", Form::kText),
        ByAdapter(DeviceKey(kGL, 6, "IsIntegratedGLGPU", "Integrated", Form::kFlag)),
        DeviceKey(kGL, 7, "GLMemoryMB", "Memory", Form::kMebibytes, Match::kInteger),
        DeviceKey(kGL, 1, "GLName", "Adapter", Form::kAdapter),
        DeviceKey(kGL, 3, "GLVendor", "Vendor", Form::kText),
        DeviceKey(kGL, 4, "GLVendorID", "Vendor id", Form::kId),
        DeviceKey(kGL, 11, "GLDriverVersion", "Driver version", Form::kText),
        DeviceKey(kGL, 16, "GLRectTextureSize", "Max. rectangle texture", Form::kTexels),
        DeviceKey(kGL, 2, "GLRenderer", "Renderer", Form::kText),
        DeviceKey(kGL, 5, "GLRendererID", "Device id", Form::kId),
        DeviceKey(kGL, 15, "HasGLNPOTSupport", "Textures of any size", Form::kFlag),
        DeviceKey(kGL, 10, "GLDriver", "Driver", Form::kText),
        DeviceKey(kGL, 12, "GLDriverDate", "Driver date", Form::kDate),
        DeviceKey(kGL, 13, "CanCompileProgramGLSL", "Shaders compile", Form::kFlag),
        DeviceKey(kGL, 14, "GLFrameBufferOK", "Framebuffers work", Form::kFlag),
        String(9, "GL_SHADING_LANGUAGE_VERSION", 35724, "Shading language"),
        Program("GL_MAX_PROGRAM_INSTRUCTIONS_ARB", 34977, "Assembly instructions"),
        Integers("GL_MAX_TEXTURE_UNITS", 34018, "Textures without shaders"),
        Integers("GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", 35661, "Textures in all shaders"),
        Integers("GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS", 35660, "Vertex shader textures"),
        Integers("GL_MAX_TEXTURE_IMAGE_UNITS", 34930, "Fragment shader textures"),
        Integers("GL_MAX_DRAW_BUFFERS", 34852, "Draw buffers"),
        Integers("GL_MAX_VERTEX_UNIFORM_COMPONENTS", 35658, "Vertex uniforms"),
        Integers("GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", 35657, "Fragment uniforms"),
        Integers("GL_MAX_VARYING_FLOATS", 35659, "Varying floats"),
        Integers("GL_MAX_VERTEX_ATTRIBS", 34921, "Vertex attributes"),
        Extension("GL_ARB_VERTEX_PROGRAM", 69, "GL_ARB_vertex_program"),
        Extension("GL_ARB_FRAGMENT_PROGRAM", 27, "GL_ARB_fragment_program"),
        Extension("GL_ARB_VERTEX_SHADER", 70, "GL_ARB_vertex_shader"),
        Extension("GL_ARB_FRAGMENT_SHADER", 28, "GL_ARB_fragment_shader"),
        Extension("GL_EXT_FRAMEBUFFER_OBJECT", 81, "GL_EXT_framebuffer_object"),
        Extension("GL_ARB_TEXTURE_RECTANGLE", 58, "GL_ARB_texture_rectangle"),
        Extension("GL_ARB_TEXTURE_FLOAT", 53, "GL_ARB_texture_float"),
        Extension("GL_ARB_OCCLUSION_QUERY", 37, "GL_ARB_occlusion_query"),
        Extension("GL_ARB_VERTEX_BUFFER_OBJECT", 68, "GL_ARB_vertex_buffer_object"),
        Extension("GL_ARB_SHADER_TEXTURE_LOD", 47, "GL_ARB_shader_texture_lod"),

        ReportKey(GetCountKey(kCL)),
        DeviceKey(kCL, 7, "CLPlatformVersion", "Platform version", Form::kText),
        DeviceKey(kCL, 6, "CLDeviceVersion", "OpenCL version", Form::kText),
        DeviceKey(kCL, 4, "IsIntegratedCLGPU", "Integrated", Form::kFlag),
        DeviceKey(kCL, 5, "CLMemoryMB", "Memory", Form::kMebibytes, Match::kInteger),
        DeviceKey(kCL, 1, "CLName", "Name", Form::kText),
        DeviceKey(kCL, 2, "CLVendor", "Vendor", Form::kText),
        DeviceKey(kCL, 3, "CLVendorID", "Vendor id", Form::kId),
        DeviceKey(kCL, 8, "CLDriverVersion", "Driver version", Form::kText),
        DeviceKey(kCL, 11, "CUDASupported", "CUDA", Form::kFlag),
        DeviceKey(kCL, 12, "CUDAVersion", "CUDA version", Form::kText, Match::kExact,
                  "CUDASupported"),
        DeviceKey(kCL, 9, "CLBandwidth", "Copy bandwidth", Form::kBytesPerSecond, Match::kNumber),
        DeviceKey(kCL, 10, "CLCompute", "Compute score", Form::kScore, Match::kNumber),

        ReportKey("assayEnd", Match::kStamp),
    };
}

} // namespace

const char* GetKindName(DeviceKind kind)
{
    return kind == kGL ? "OpenGL" : "OpenCL";
}

const char* GetTagWord(DeviceKind kind)
{
    return kind == kGL ? "glgpu" : "clgpu";
}

std::string MakeTag(DeviceKind kind, std::size_t index)
{
    return fmt::format("{}[{}]", GetTagWord(kind), index);
}

const char* GetCountKey(DeviceKind kind)
{
    return kind == kGL ? "NumGLGPUs" : "NumCLGPUs";
}

std::string KnownKey::GetKey(const std::string& tag) const
{
    return tag.empty() ? fKey : tag + "." + fKey;
}

const std::vector<KnownKey>& GetKnownKeys()
{
    static const std::vector<KnownKey> keys = MakeKnownKeys();
    return keys;
}

Table<KnownKey> GetDeviceKeys(DeviceKind kind)
{
    const auto find = [](DeviceKind which) {
        const std::vector<KnownKey>& keys = GetKnownKeys();
        const auto isOfKind = [which](const KnownKey& key) { return key.fKind == which; };
        const auto first = std::find_if(keys.begin(), keys.end(), isOfKind);
        const auto end = std::find_if_not(first, keys.end(), isOfKind);
        return Table<KnownKey>{&*first, static_cast<std::size_t>(end - first)};
    };
    static const Table<KnownKey> gl = find(kGL);
    static const Table<KnownKey> cl = find(kCL);
    return kind == kGL ? gl : cl;
}

const std::vector<const KnownKey*>& GetReportKeys()
{
    static const std::vector<const KnownKey*> keys = [] {
        std::vector<const KnownKey*> found;
        for (const KnownKey& key : GetKnownKeys())
            if (!key.fKind)
                found.push_back(&key);
        return found;
    }();
    return keys;
}

const KnownKey* FindKnownKey(std::optional<DeviceKind> kind, std::string_view name)
{
    static const auto places = [] {
        std::unordered_map<std::string_view, const KnownKey*> found;
        for (const KnownKey& key : GetKnownKeys())
            found.emplace(key.fKey, &key);
        return found;
    }();
    const auto place = places.find(name);
    return place != places.end() && place->second->fKind == kind ? place->second : nullptr;
}

} // namespace assay_host
