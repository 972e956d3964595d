// What DRM drivers answer about a card's memory: the questions, and how the kernel's answers are
// taken from it. What the answers mean is DrmMemory's work.
#pragma once

#include <string>

namespace pmutil {

// The system's bare calls; replaceable for tests. They fail with a negative result.
struct DrmCalls {
    int (*open)(const char* path);
    int (*ioctl)(int node, unsigned long request, void* argument);
    void (*close)(int node);
};

// The calls of this system.
const DrmCalls& SystemDrmCalls();

// Whether there is a question that the driver of that name answers.
bool AnswersOnDrmNode(const std::string& driver);

// What the driver of that name answers on a render node such as "renderD128", byte by byte as the
// kernel writes it:
//   i915     DRM_IOCTL_I915_QUERY, DRM_I915_QUERY_MEMORY_REGIONS: drm_i915_query_memory_regions
//   xe       DRM_IOCTL_XE_DEVICE_QUERY, DRM_XE_DEVICE_QUERY_MEM_REGIONS: drm_xe_query_mem_regions
//   radeon   DRM_IOCTL_RADEON_GEM_INFO: drm_radeon_gem_info
//   nouveau  DRM_IOCTL_NOUVEAU_GETPARAM, NOUVEAU_GETPARAM_FB_SIZE: drm_nouveau_getparam
// Empty if the node can't be opened or the driver doesn't answer. Opening the node of a sleeping
// card wakes it, so ask only if it is awake. Throws nothing but std::bad_alloc.
std::string AskDrmNode(const DrmCalls& calls, const std::string& node, const std::string& driver);

// The same under QGF::SystemRoot: of a recorded machine the answer stands in the file
// /dev/dri/NODE.DRIVER, such as "renderD128.i915".
std::string AskDrmNode(const std::string& node, const std::string& driver);

} // namespace pmutil
