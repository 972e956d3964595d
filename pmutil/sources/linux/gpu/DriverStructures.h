// Structures of driver interfaces that libdrm's headers lack: they have no xe_drm.h, and their
// nouveau_drm.h isn't valid C++. From include/uapi/drm/xe_drm.h and nouveau_drm.h of Linux 6.12.
#pragma once

#include <cstdint>

#include <drm.h>

namespace pmutil {

struct XeDeviceQuery {
    std::uint64_t extensions;
    std::uint32_t query;
    std::uint32_t size;
    std::uint64_t data;
    std::uint64_t reserved[2];
};
static_assert(sizeof(XeDeviceQuery) == 40);

struct XeRegionsHead {
    std::uint32_t num_mem_regions;
    std::uint32_t pad;
};
static_assert(sizeof(XeRegionsHead) == 8);

struct XeRegion {
    std::uint16_t mem_class;
    std::uint16_t instance;
    std::uint32_t min_page_size;
    std::uint64_t total_size;
    std::uint64_t used;
    std::uint64_t cpu_visible_size;
    std::uint64_t cpu_visible_used;
    std::uint64_t reserved[6];
};
static_assert(sizeof(XeRegion) == 88);

inline constexpr std::uint32_t kXeQueryMemRegions = 1;
inline constexpr std::uint16_t kXeClassVram = 1;
inline constexpr unsigned long kXeIoctlDeviceQuery =
    DRM_IOWR(DRM_COMMAND_BASE + 0x00, XeDeviceQuery);

struct NouveauParameter {
    std::uint64_t param;
    std::uint64_t value;
};
static_assert(sizeof(NouveauParameter) == 16);

inline constexpr std::uint64_t kNouveauFbSize = 8;
inline constexpr unsigned long kNouveauIoctlGetParam =
    DRM_IOWR(DRM_COMMAND_BASE + 0x00, NouveauParameter);

} // namespace pmutil
