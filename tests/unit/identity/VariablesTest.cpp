#include "identity/Variables.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> List(const std::map<std::string, std::string>& variables)
{
    return ListVariables([&](const std::string& name) -> std::optional<std::string> {
        const auto found = variables.find(name);
        return found == variables.end() ? std::nullopt : std::optional(found->second);
    });
}

TEST(Variables, AreThoseThatSelectADriver)
{
    EXPECT_THAT(List({{"PATH", "/bin"}, {"DISPLAY", ":0"}, {"MESA_DEBUG", "1"}}), IsEmpty());
    EXPECT_THAT(List({{"LIBGL_ALWAYS_SOFTWARE", "1"}, {"PATH", "/bin"}, {"DRI_PRIME", "pci-1"}}),
                ElementsAre("DRI_PRIME=pci-1", "LIBGL_ALWAYS_SOFTWARE=1"));
}

// libglvnd takes an empty list for one without a driver.
TEST(Variables, MayBeEmpty)
{
    EXPECT_THAT(List({{"__EGL_VENDOR_LIBRARY_FILENAMES", ""}}),
                ElementsAre("__EGL_VENDOR_LIBRARY_FILENAMES="));
}

TEST(Variables, AreThoseOfEachLoaderAndDriver)
{
    const std::vector<std::string> names = {
        "CLOVER_DEVICE_TYPE",
        "CLOVER_DEVICE_VERSION_OVERRIDE",
        "CLOVER_PLATFORM_VERSION_OVERRIDE",
        "CUDA_VISIBLE_DEVICES",
        "DRI_PRIME",
        "EGL_PLATFORM",
        "GALLIUM_DRIVER",
        "GALLIUM_PIPE_SEARCH_DIR",
        "GBM_ALWAYS_SOFTWARE",
        "GBM_BACKEND",
        "GBM_BACKENDS_PATH",
        "GPU_DEVICE_ORDINAL",
        "HIP_VISIBLE_DEVICES",
        "LIBGL_ALWAYS_SOFTWARE",
        "LIBGL_DRI2_DISABLE",
        "LIBGL_DRI3_DISABLE",
        "LIBGL_DRIVERS_PATH",
        "LIBGL_KOPPER_DISABLE",
        "MESA_D3D12_DEFAULT_ADAPTER_NAME",
        "MESA_EXTENSION_OVERRIDE",
        "MESA_GLES_VERSION_OVERRIDE",
        "MESA_GLSL_VERSION_OVERRIDE",
        "MESA_GL_VERSION_OVERRIDE",
        "MESA_LOADER_DRIVER_OVERRIDE",
        "MESA_VK_DEVICE_SELECT",
        "OCL_ICD_ASSUME_ICD_EXTENSION",
        "OCL_ICD_DEFAULT_PLATFORM",
        "OCL_ICD_FILENAMES",
        "OCL_ICD_PLATFORM_SORT",
        "OCL_ICD_VENDORS",
        "OPENCL_LAYERS",
        "OPENCL_LAYER_PATH",
        "OPENCL_VENDOR_PATH",
        "POCL_DEVICES",
        "ROCR_VISIBLE_DEVICES",
        "RUSTICL_DEVICE_TYPE",
        "RUSTICL_ENABLE",
        "ZE_AFFINITY_MASK",
        "__EGL_EXTERNAL_PLATFORM_CONFIG_DIRS",
        "__EGL_EXTERNAL_PLATFORM_CONFIG_FILENAMES",
        "__EGL_VENDOR_LIBRARY_DIRS",
        "__EGL_VENDOR_LIBRARY_FILENAMES",
        "__GLX_VENDOR_LIBRARY_NAME",
        "__NV_PRIME_RENDER_OFFLOAD",
        "__NV_PRIME_RENDER_OFFLOAD_PROVIDER",
    };
    std::vector<std::string> expected;
    for (const std::string& name : names)
        expected.push_back(name + "=x");
    EXPECT_EQ(ListVariables([](const std::string&) { return std::optional<std::string>("x"); }),
              expected);
}

} // namespace
} // namespace assay_host
