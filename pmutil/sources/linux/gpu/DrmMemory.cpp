#include "linux/gpu/DrmMemory.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <limits>
#include <sstream>

#include <drm.h>
#include <i915_drm.h>
#include <radeon_drm.h>

#include "linux/gpu/DriverStructures.h"
#include "linux/gpu/SystemNumbers.h"

namespace pmutil {
namespace {

using Bytes = std::optional<std::uint64_t>;

// The structure at an offset of an answer; false if the answer ends before it does.
template <typename Structure>
bool At(const std::string& answer, std::size_t offset, Structure& structure)
{
    if (offset > answer.size() || answer.size() - offset < sizeof structure)
        return false;
    std::memcpy(&structure, answer.data() + offset, sizeof structure);
    return true;
}

Bytes Sum(Bytes total, std::uint64_t bytes)
{
    return total && bytes <= std::numeric_limits<std::uint64_t>::max() - *total
               ? Bytes(*total + bytes)
               : std::nullopt;
}

// A head, followed by as many regions as it says. An answer that is cut short is none.
template <typename Region, typename Local>
Bytes LocalMemory(const std::string& answer, std::size_t headSize, std::size_t count, Local local)
{
    Bytes total = 0;
    for (std::size_t i = 0; total && i != count; ++i) {
        Region region{};
        total = At(answer, headSize + i * sizeof region, region) ? Sum(total, local(region))
                                                                 : std::nullopt;
    }
    return count == 0 ? std::nullopt : total;
}

Bytes InI915Answer(const std::string& answer)
{
    drm_i915_query_memory_regions head; // not {}: it ends in a zero-size array, an extension
    if (!At(answer, 0, head))
        return std::nullopt;
    return LocalMemory<drm_i915_memory_region_info>(
        answer, sizeof head, head.num_regions, [](const drm_i915_memory_region_info& region) {
            return region.region.memory_class == I915_MEMORY_CLASS_DEVICE ? region.probed_size : 0;
        });
}

Bytes InXeAnswer(const std::string& answer)
{
    XeRegionsHead head{};
    if (!At(answer, 0, head))
        return std::nullopt;
    return LocalMemory<XeRegion>(
        answer, sizeof head, head.num_mem_regions, [](const XeRegion& region) {
            return region.mem_class == kXeClassVram ? region.total_size : 0;
        });
}

Bytes InRadeonAnswer(const std::string& answer)
{
    drm_radeon_gem_info info{};
    return At(answer, 0, info) ? Bytes(info.vram_size) : std::nullopt;
}

Bytes InNouveauAnswer(const std::string& answer)
{
    NouveauParameter parameter{};
    return At(answer, 0, parameter) && parameter.param == kNouveauFbSize ? Bytes(parameter.value)
                                                                         : std::nullopt;
}

struct Reader {
    const char* driver;
    Bytes (*read)(const std::string& answer);
};

constexpr Reader kReaders[] = {
    {"i915", InI915Answer},
    {"xe", InXeAnswer},
    {"radeon", InRadeonAnswer},
    {"nouveau", InNouveauAnswer},
};

} // namespace

std::optional<std::uint64_t> MemoryInAnswer(const std::string& driver, const std::string& answer)
{
    const auto* const reader =
        std::find_if(std::begin(kReaders), std::end(kReaders),
                     [&](const Reader& candidate) { return candidate.driver == driver; });
    return reader == std::end(kReaders) ? std::nullopt : reader->read(answer);
}

std::uint64_t LargestPrefetchableBar(const std::string& resource)
{
    // IORESOURCE_MEM and IORESOURCE_PREFETCH of the kernel's include/linux/ioport.h.
    constexpr std::uint64_t kPrefetchableMemory = 0x200 | 0x2000;
    constexpr int kBars = 6;
    std::uint64_t largest = 0;
    std::istringstream lines(resource);
    std::string line;
    for (int i = 0; i != kBars && std::getline(lines, line); ++i) {
        std::istringstream words(line);
        std::string texts[3];
        words >> texts[0] >> texts[1] >> texts[2];
        std::uint64_t first = 0;
        std::uint64_t last = 0;
        std::uint64_t flags = 0;
        if (ParseSystemNumber(texts[0], first) && ParseSystemNumber(texts[1], last) &&
            ParseSystemNumber(texts[2], flags) &&
            (flags & kPrefetchableMemory) == kPrefetchableMemory && last > first &&
            last - first != std::numeric_limits<std::uint64_t>::max())
            largest = std::max(largest, last - first + 1);
    }
    return largest;
}

} // namespace pmutil
