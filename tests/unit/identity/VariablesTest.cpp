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
    for (const char* const name :
         {"DRI_PRIME", "LIBGL_ALWAYS_SOFTWARE", "LIBGL_DRIVERS_PATH", "MESA_LOADER_DRIVER_OVERRIDE",
          "GALLIUM_DRIVER", "GBM_BACKEND", "EGL_PLATFORM", "__EGL_VENDOR_LIBRARY_DIRS",
          "__EGL_VENDOR_LIBRARY_FILENAMES", "__NV_PRIME_RENDER_OFFLOAD", "OCL_ICD_VENDORS",
          "OCL_ICD_FILENAMES", "OPENCL_VENDOR_PATH", "OPENCL_LAYERS", "RUSTICL_ENABLE",
          "POCL_DEVICES", "CUDA_VISIBLE_DEVICES", "ROCR_VISIBLE_DEVICES", "ZE_AFFINITY_MASK"})
        EXPECT_THAT(List({{name, "value"}}), ElementsAre(std::string(name) + "=value"));
}

} // namespace
} // namespace assay_host
