#include <algorithm>
#include <cstring>
#include <string_view>

#include "qgf/OGL.h"
#include "qgf/qgf_ogl/OpenGLConstants.h"

namespace QGF {
namespace OGL {

namespace {

constexpr char kSourceFile[] = "qgf/source/qgf/qgf_ogl/ExtensionManager";

// No driver has a tenth as many. A larger number isn't a count of extensions.
constexpr std::int32_t kMaxExtensions = 65536;

constexpr int kMaxVersionNumber = 9999;

// A feature is supported from a core version on (0.0 for none), or if any of the extensions is.
struct Source {
    OpenGLExtension extension;
    int major;
    int minor;
    const char* names[3];
};

constexpr Source kSources[] = {
    {GL_VERSION_1_2, 1, 2, {}},
    {GL_IMAGING_1_2, 0, 0, {"GL_ARB_imaging"}},
    {GL_VERSION_1_3, 1, 3, {}},
    {GL_VERSION_1_4, 1, 4, {}},
    {GL_VERSION_1_5, 1, 5, {}},
    {GL_VERSION_2_0, 2, 0, {}},
    {GL_VERSION_2_1, 2, 1, {}},
    {GL_VERSION_3_0, 3, 0, {}},
    {GL_VERSION_3_1, 3, 1, {}},
    {GL_VERSION_3_2, 3, 2, {}},
    {GL_VERSION_3_3, 3, 3, {}},
    {GL_VERSION_4_0, 4, 0, {}},
    {GL_VERSION_4_1, 4, 1, {}},
    // Assembly programs are in no core version.
    {GL_ARB_FRAGMENT_PROGRAM, 0, 0, {"GL_ARB_fragment_program"}},
    {GL_ARB_FRAGMENT_SHADER, 2, 0, {"GL_ARB_fragment_shader"}},
    {GL_ARB_OCCLUSION_QUERY, 1, 5, {"GL_ARB_occlusion_query"}},
    // GLSL 1.30 has these functions under other names.
    {GL_ARB_SHADER_TEXTURE_LOD, 0, 0, {"GL_ARB_shader_texture_lod"}},
    // Core 3.0 has the RGB and RGBA formats but not luminance, alpha and intensity. The ATI
    // extension has all of them, with the same values.
    {GL_ARB_TEXTURE_FLOAT, 0, 0, {"GL_ARB_texture_float", "GL_ATI_texture_float"}},
    {GL_ARB_TEXTURE_NON_POWER_OF_TWO, 2, 0, {"GL_ARB_texture_non_power_of_two"}},
    // The three extensions have the same target and the same values. Core since 3.1.
    {GL_ARB_TEXTURE_RECTANGLE,
     3,
     1,
     {"GL_ARB_texture_rectangle", "GL_EXT_texture_rectangle", "GL_NV_texture_rectangle"}},
    {GL_ARB_VERTEX_BUFFER_OBJECT, 1, 5, {"GL_ARB_vertex_buffer_object"}},
    {GL_ARB_VERTEX_PROGRAM, 0, 0, {"GL_ARB_vertex_program"}},
    {GL_ARB_VERTEX_SHADER, 2, 0, {"GL_ARB_vertex_shader"}},
    // Core 3.0 and the ARB extension are supersets of the EXT extension.
    {GL_EXT_FRAMEBUFFER_OBJECT, 3, 0, {"GL_EXT_framebuffer_object", "GL_ARB_framebuffer_object"}},
};

const char* AsText(const std::uint8_t* text)
{
    return reinterpret_cast<const char*>(text);
}

int ParseNumber(const char*& text)
{
    int number = 0;
    for (; *text >= '0' && *text <= '9'; ++text)
        number = std::min(number * 10 + (*text - '0'), kMaxVersionNumber);
    return number;
}

// Parses "MAJOR.MINOR"; what follows is ignored. The text of OpenGL ES begins with letters, which
// leaves 0.0.
void ParseVersion(const char* text, int& major, int& minor)
{
    const int first = ParseNumber(text);
    if (*text != '.' || text[1] < '0' || text[1] > '9')
        return;
    ++text;
    major = first;
    minor = ParseNumber(text);
}

// Reads the names one by one, as OpenGL 3.0 and later offer them. Returns false on failure.
bool ReadIndexedNames(const OpenGLInterceptor& gl, std::vector<std::string>& names)
{
    std::int32_t count = -1;
    gl.glGetIntegerv(kSourceFile, __LINE__, kGLNumExtensions, &count);
    if (count < 0 || count > kMaxExtensions)
        return false;
    for (std::int32_t index = 0; index < count; ++index) {
        const std::uint8_t* const name = gl.glGetStringi(kSourceFile, __LINE__, kGLExtensions,
                                                         static_cast<std::uint32_t>(index));
        if (name == nullptr)
            return false;
        names.emplace_back(AsText(name));
    }
    return true;
}

// Reads the names from one text, separated by blanks. Returns false on failure.
bool ReadNameList(const OpenGLInterceptor& gl, std::vector<std::string>& names)
{
    const std::uint8_t* const list = gl.glGetString(kSourceFile, __LINE__, kGLExtensions);
    if (list == nullptr)
        return false;
    const char* text = AsText(list);
    for (;;) {
        text += std::strspn(text, " ");
        const std::size_t length = std::strcspn(text, " ");
        if (length == 0)
            return true;
        names.emplace_back(text, length);
        text += length;
    }
}

// Removes the errors of a failed query from OpenGL's queue, so that the caller's next glGetError
// doesn't return them. The number is limited, since a broken driver may return errors forever.
void ClearErrors(const OpenGLInterceptor& gl)
{
    constexpr int kMaxErrors = 16;
    for (int i = 0; i < kMaxErrors && gl.glGetError(kSourceFile, __LINE__) != kGLNoError; ++i) {
    }
}

} // namespace

ExtensionManager* ExtensionManager::Instance()
{
    Context* const context = Context::Current();
    return context != nullptr ? &context->extensionManager() : nullptr;
}

ExtensionManager::ExtensionManager(const OpenGLInterceptor& gl)
{
    const std::uint8_t* const version = gl.glGetString(kSourceFile, __LINE__, kGLVersion);
    bool ok = version != nullptr;
    if (ok)
        ParseVersion(AsText(version), fMajor, fMinor);
    // Make only queries that this version allows, so that a working driver raises no error.
    const bool indexed = fMajor >= 3 && ReadIndexedNames(gl, fNames);
    if (!indexed) {
        ok = ok && fMajor < 3;
        ok = ReadNameList(gl, fNames) && ok;
    }
    if (!ok)
        ClearErrors(gl);
    std::sort(fNames.begin(), fNames.end());
}

bool ExtensionManager::isSupported(OpenGLExtension extension) const
{
    const auto* const source =
        std::find_if(std::begin(kSources), std::end(kSources),
                     [extension](const Source& row) { return row.extension == extension; });
    if (source == std::end(kSources))
        return false;
    if (source->major != 0 &&
        (fMajor > source->major || (fMajor == source->major && fMinor >= source->minor)))
        return true;
    return std::any_of(
        std::begin(source->names), std::end(source->names), [this](const char* name) {
            return name != nullptr &&
                   std::binary_search(fNames.begin(), fNames.end(), std::string_view(name));
        });
}

} // namespace OGL
} // namespace QGF
