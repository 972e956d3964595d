#include "Model.h"

#include <cstdlib>
#include <sstream>
#include <utility>

#include <EGL/egl.h>
#include <EGL/eglext.h>
#include <GL/gl.h>
#include <GL/glext.h>

namespace scripted {

namespace {

#define NAME(name)                                                                                 \
    {                                                                                              \
#name, name                                                                                \
    }
const std::map<std::string, std::int64_t>& KnownNames()
{
    static const std::map<std::string, std::int64_t> kNames = {
        // EGL
        NAME(EGL_VENDOR), NAME(EGL_VERSION), NAME(EGL_EXTENSIONS), NAME(EGL_CLIENT_APIS),
        NAME(EGL_DRM_DEVICE_FILE_EXT), NAME(EGL_DRM_RENDER_NODE_FILE_EXT), NAME(EGL_RENDERER_EXT),
        NAME(EGL_DRIVER_NAME_EXT), NAME(EGL_NOT_INITIALIZED), NAME(EGL_BAD_ACCESS),
        NAME(EGL_BAD_ALLOC), NAME(EGL_BAD_ATTRIBUTE), NAME(EGL_BAD_CONFIG), NAME(EGL_BAD_CONTEXT),
        NAME(EGL_BAD_DISPLAY), NAME(EGL_BAD_MATCH), NAME(EGL_BAD_PARAMETER), NAME(EGL_BAD_SURFACE),
        NAME(EGL_CONTEXT_LOST),
        // OpenGL: texts and errors
        NAME(GL_VENDOR), NAME(GL_RENDERER), NAME(GL_VERSION), NAME(GL_EXTENSIONS),
        NAME(GL_SHADING_LANGUAGE_VERSION), NAME(GL_NO_ERROR), NAME(GL_INVALID_ENUM),
        NAME(GL_INVALID_VALUE), NAME(GL_INVALID_OPERATION), NAME(GL_OUT_OF_MEMORY),
        NAME(GL_INVALID_FRAMEBUFFER_OPERATION), NAME(GL_CONTEXT_LOST),
        // OpenGL: limits
        NAME(GL_MAJOR_VERSION), NAME(GL_MINOR_VERSION), NAME(GL_NUM_EXTENSIONS),
        NAME(GL_CONTEXT_FLAGS), NAME(GL_CONTEXT_PROFILE_MASK), NAME(GL_MAX_TEXTURE_SIZE),
        NAME(GL_MAX_PROGRAM_INSTRUCTIONS_ARB), NAME(GL_MAX_TEXTURE_UNITS),
        NAME(GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS), NAME(GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS),
        NAME(GL_MAX_TEXTURE_IMAGE_UNITS), NAME(GL_MAX_DRAW_BUFFERS),
        NAME(GL_MAX_VERTEX_UNIFORM_COMPONENTS), NAME(GL_MAX_FRAGMENT_UNIFORM_COMPONENTS),
        NAME(GL_MAX_VARYING_FLOATS), NAME(GL_MAX_VERTEX_ATTRIBS),
        NAME(GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB), NAME(GL_TEXTURE_FREE_MEMORY_ATI),
        NAME(GL_GPU_MEMORY_INFO_DEDICATED_VIDMEM_NVX),
        // OpenGL: objects
        NAME(GL_FRAGMENT_PROGRAM_ARB), NAME(GL_VERTEX_SHADER), NAME(GL_FRAGMENT_SHADER),
        NAME(GL_COMPILE_STATUS), NAME(GL_LINK_STATUS), NAME(GL_INFO_LOG_LENGTH),
        NAME(GL_FRAMEBUFFER_UNSUPPORTED)};
    return kNames;
}
#undef NAME

Device DefaultDevice(int index)
{
    Device device;
    device.deviceTexts[EGL_EXTENSIONS] = "";
    device.displayTexts = {{EGL_VENDOR, "Scripted"},
                           {EGL_VERSION, "1.5 Scripted"},
                           {EGL_CLIENT_APIS, "OpenGL OpenGL_ES"},
                           {EGL_EXTENSIONS,
                            "EGL_KHR_create_context EGL_KHR_get_all_proc_addresses "
                            "EGL_KHR_no_config_context EGL_KHR_surfaceless_context"}};
    device.glTexts = {
        {GL_VENDOR, "Scripted vendor"},
        {GL_RENDERER, "Scripted renderer " + std::to_string(index)},
        {GL_VERSION, "4.6 (Compatibility Profile) Scripted"},
        {GL_SHADING_LANGUAGE_VERSION, "4.60"},
        {GL_EXTENSIONS,
         "GL_ARB_vertex_program GL_ARB_fragment_program GL_ARB_vertex_shader "
         "GL_ARB_fragment_shader GL_EXT_framebuffer_object GL_ARB_framebuffer_object "
         "GL_ARB_texture_rectangle GL_ARB_texture_float GL_ARB_occlusion_query "
         "GL_ARB_vertex_buffer_object GL_ARB_shader_texture_lod GL_ARB_texture_non_power_of_two"}};
    device.integers = {{GL_MAX_TEXTURE_SIZE, {16384}},
                       {GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB, {16384}},
                       {GL_MAX_TEXTURE_UNITS, {8}},
                       {GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS, {192}},
                       {GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS, {32}},
                       {GL_MAX_TEXTURE_IMAGE_UNITS, {31}},
                       {GL_MAX_DRAW_BUFFERS, {7}},
                       {GL_MAX_VERTEX_UNIFORM_COMPONENTS, {4096}},
                       {GL_MAX_FRAGMENT_UNIFORM_COMPONENTS, {4095}},
                       {GL_MAX_VARYING_FLOATS, {124}},
                       {GL_MAX_VERTEX_ATTRIBS, {16}},
                       {GL_CONTEXT_FLAGS, {0}},
                       {GL_CONTEXT_PROFILE_MASK, {GL_CONTEXT_COMPATIBILITY_PROFILE_BIT}}};
    device.programLimits = {{GL_MAX_PROGRAM_INSTRUCTIONS_ARB, {16000}}};
    return device;
}

void Offer(Device& device, const std::string& extension)
{
    std::string& list =
        device.deviceTexts[EGL_EXTENSIONS].emplace(device.deviceTexts[EGL_EXTENSIONS].value_or(""));
    if (!HoldsWord(list, extension))
        list += (list.empty() ? "" : " ") + extension;
}

std::vector<std::int32_t> TakeIntegers(Line& line)
{
    std::vector<std::int32_t> values;
    do {
        values.push_back(static_cast<std::int32_t>(line.TakeNumber("a value", NumberOf)));
    } while (!line.AtEnd());
    return values;
}

// Reads a directive for the whole driver. Returns false for others.
bool ReadGlobal(Model& model, const std::string& verb, Line& line)
{
    if (verb == "record") {
        model.monitor.RecordTo(line.Take("a file").text);
    } else if (verb == "at") {
        model.monitor.AddRule(line, NumberOf);
    } else if (verb == "absent") {
        do {
            model.absent.push_back(line.Take("an entry point").text);
        } while (!line.AtEnd());
    } else if (verb == "client-extensions") {
        model.clientExtensions = line.TakeText("the extensions");
    } else if (verb == "default-device") {
        model.defaultDevice = static_cast<int>(line.TakeNumber("a device's number"));
    } else if (verb == "egl-version") {
        model.eglMajor = static_cast<std::int32_t>(line.TakeNumber("the major version"));
        model.eglMinor = static_cast<std::int32_t>(line.TakeNumber("the minor version"));
    } else if (verb == "device") {
        model.devices.push_back(DefaultDevice(static_cast<int>(model.devices.size())));
    } else {
        return false;
    }
    return true;
}

void ReadOfDevice(Device& device, const std::string& verb, Line& line)
{
    static const std::map<std::string, Texts Device::*> kTexts = {
        {"device-string", &Device::deviceTexts},
        {"display-string", &Device::displayTexts},
        {"string", &Device::glTexts}};
    static const std::map<std::string, std::map<std::int64_t, std::vector<std::int32_t>> Device::*>
        kIntegers = {{"integer", &Device::integers}, {"program-integer", &Device::programLimits}};
    static const std::map<std::string, std::optional<std::string> Device::*> kLogs = {
        {"vertex-fails", &Device::vertexLog},
        {"fragment-fails", &Device::fragmentLog},
        {"link-fails", &Device::linkLog}};
    if (verb == "software") {
        Offer(device, "EGL_MESA_device_software");
    } else if (verb == "drm") {
        Offer(device, "EGL_EXT_device_drm");
        device.deviceTexts[EGL_DRM_DEVICE_FILE_EXT] = line.TakeText("the device file");
        if (!line.AtEnd()) {
            Offer(device, "EGL_EXT_device_drm_render_node");
            device.deviceTexts[EGL_DRM_RENDER_NODE_FILE_EXT] = line.TakeText("the render node");
        }
    } else if (verb == "name") {
        Offer(device, "EGL_EXT_device_query_name");
        device.deviceTexts[EGL_RENDERER_EXT] = line.TakeText("the device's name");
        device.deviceTexts[EGL_VENDOR] = line.AtEnd() ? "Scripted" : line.TakeText("the vendor");
    } else if (verb == "extensions") {
        device.glTexts[GL_EXTENSIONS] = line.TakeText("the extensions");
    } else if (verb == "version") {
        device.glTexts[GL_VERSION] = line.TakeText("the version");
    } else if (const auto texts = kTexts.find(verb); texts != kTexts.end()) {
        const std::int64_t name = line.TakeNumber("the text's name", NumberOf);
        (device.*texts->second)[name] = line.TakeText("the text");
    } else if (const auto integers = kIntegers.find(verb); integers != kIntegers.end()) {
        const std::int64_t name = line.TakeNumber("the value's name", NumberOf);
        if (line.TakeIf("unknown"))
            (device.*integers->second).erase(name);
        else
            (device.*integers->second)[name] = TakeIntegers(line);
    } else if (const auto log = kLogs.find(verb); log != kLogs.end()) {
        device.*log->second = line.AtEnd() ? "" : line.TakeText("the log");
    } else {
        line.Fail("unknown word \"" + verb + "\"");
    }
}

void ReadModel(Model& model)
{
    model.clientExtensions =
        "EGL_EXT_client_extensions EGL_EXT_device_base EGL_EXT_device_enumeration "
        "EGL_EXT_device_query EGL_EXT_platform_base EGL_EXT_platform_device "
        "EGL_KHR_client_get_all_proc_addresses EGL_MESA_platform_surfaceless";
    const char* path = std::getenv("ASSAY_SCRIPTED_EGL");
    if (path == nullptr) {
        model.devices.push_back(DefaultDevice(0));
        return;
    }
    for (Line& line : ReadScript(path)) {
        const std::string verb = line.Take("a word").text;
        if (!ReadGlobal(model, verb, line)) {
            if (model.devices.empty())
                line.Fail("\"" + verb + "\" is unknown or stands before the first device");
            ReadOfDevice(model.devices.back(), verb, line);
        }
        if (!line.AtEnd())
            line.Fail("words are left at the end of the line");
    }
}

} // namespace

Model& GetModel()
{
    // Never freed: the driver may be called from exit handlers.
    static Model* const kModel = [] {
        auto* model = new Model;
        ReadModel(*model);
        return model;
    }();
    return *kModel;
}

std::optional<std::int64_t> NumberOf(const std::string& name)
{
    const auto found = KnownNames().find(name);
    if (found == KnownNames().end())
        return {};
    return found->second;
}

bool HoldsWord(const std::string& list, const std::string& word)
{
    std::istringstream words(list);
    for (std::string each; words >> each;)
        if (each == word)
            return true;
    return false;
}

} // namespace scripted
