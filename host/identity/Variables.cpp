// The variables are read by libglvnd (src/EGL/libeglvendor.c, src/EGL/libegl.c), Mesa
// (docs/envvars.rst), the OpenCL loaders (libOpenCL(7), loader/linux/icd_linux.c), PoCL
// (doc/sphinx/source/env_variables.rst), NVIDIA's driver (README, "PRIME Render Offload"), ROCm
// ("GPU isolation") and Intel's Level Zero ("Affinity Mask"). Left out are those that only find
// libraries, such as LD_LIBRARY_PATH: the files that they lead to count. So do variables for
// messages and caches.
#include "identity/Variables.h"

#include <algorithm>

namespace assay_host {

namespace {

constexpr const char* kNames[] = {
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

} // namespace

std::vector<std::string> ListVariables(const GetVariableFunction& get)
{
    std::vector<std::string> list;
    for (const std::string name : kNames)
        if (const auto value = get(name))
            list.push_back(name + "=" + *value);
    std::sort(list.begin(), list.end());
    return list;
}

} // namespace assay_host
