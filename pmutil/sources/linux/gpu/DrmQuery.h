// Queries DRM drivers for a card's memory by ioctls. DrmMemory.h parses the answers.
#pragma once

#include <string>

namespace pmutil {

// The system calls; tests replace them. A negative result is a failure, with errno set.
struct DrmCalls {
    int (*open)(const char* path);
    int (*ioctl)(int node, unsigned long request, void* argument);
    void (*close)(int node);
};

// The real system calls.
const DrmCalls& SystemDrmCalls();

// Returns whether there is a query for the driver of that name.
bool HasDrmQuery(const std::string& driver);

// Queries the driver on a render node such as "renderD128" and returns the bytes that the kernel
// writes:
//   i915     DRM_IOCTL_I915_QUERY, DRM_I915_QUERY_MEMORY_REGIONS: drm_i915_query_memory_regions
//   xe       DRM_IOCTL_XE_DEVICE_QUERY, DRM_XE_DEVICE_QUERY_MEM_REGIONS: drm_xe_query_mem_regions
//   radeon   DRM_IOCTL_RADEON_GEM_INFO: drm_radeon_gem_info
//   nouveau  DRM_IOCTL_NOUVEAU_GETPARAM, NOUVEAU_GETPARAM_FB_SIZE: drm_nouveau_getparam
// Empty if the node can't be opened or the query fails. Opening the node of a suspended card wakes
// it: call this only for an active card. Throws only std::bad_alloc.
std::string QueryDrmNode(const DrmCalls& calls, const std::string& node, const std::string& driver);

// The same with the real system calls. Under a replaced QGF::SystemRoot, reads the recorded answer
// from the file /dev/dri/NODE.DRIVER, such as "renderD128.i915".
std::string QueryDrmNode(const std::string& node, const std::string& driver);

} // namespace pmutil
