#include "report/Software.h"

#include <algorithm>

namespace assay_host {

namespace {

// Parts of names, in lower case.
constexpr std::string_view kNames[] = {
    "llvmpipe",            // Mesa: GL_RENDERER, CL_DEVICE_NAME; in Zink's and virgl's texts, too
    "softpipe",            // Mesa
    "swrast",              // Mesa: the name of its software drivers
    "lavapipe",            // Mesa: its Vulkan driver, under Zink or ANGLE
    "software rasterizer", // Mesa's first one: "Software Rasterizer"
    "swiftshader",         // "Google SwiftShader"; "ANGLE (Google, Vulkan ... (SwiftShader ..."
    "gdi generic",         // Windows: OpenGL without a driver
    "basic render driver", // Windows: "Microsoft Basic Render Driver", and Mesa's OpenGL on it
    "oclgrind",            // "Oclgrind Simulator", which also claims to be a GPU
};

// The device before PoCL's build hash: "3.0 PoCL HSTR: cpu-x86_64-pc-linux-gnu-haswell". Graphics
// cards have other names there, such as "CUDA-sm_75".
constexpr std::string_view kVersions[] = {
    "pocl hstr: pthread-",
    "pocl hstr: cpu-",
    "pocl hstr: basic-",
};

std::string ToLower(std::string_view text)
{
    std::string lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(), [](char character) {
        return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a')
                                                    : character;
    });
    return lower;
}

template <std::size_t kSize>
bool HasPart(std::string_view text, const std::string_view (&parts)[kSize])
{
    const std::string lower = ToLower(text);
    return std::any_of(std::begin(parts), std::end(parts), [&lower](std::string_view part) {
        return lower.find(part) != std::string::npos;
    });
}

} // namespace

bool IsSoftwareName(std::string_view name)
{
    return HasPart(name, kNames);
}

bool IsSoftwareVersion(std::string_view version)
{
    return HasPart(version, kVersions);
}

std::string FindSoftwareText(const DeviceAnswers& device)
{
    for (const char* key : {"GLRenderer", "GLName", "CLName"}) {
        std::string name = device.GetValue(key);
        if (IsSoftwareName(name))
            return name;
    }
    std::string version = device.GetValue("CLDeviceVersion");
    return IsSoftwareVersion(version) ? version : std::string();
}

bool CanTellSoftware(const DeviceAnswers& device)
{
    return !FindSoftwareText(device).empty() ||
           device.Find(device.fKind == DeviceKind::kOpenGL ? "GLRenderer" : "CLName") != nullptr;
}

} // namespace assay_host
