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

// Copies the structure at an offset of an answer. Returns false if the answer is too short.
template <typename Structure>
bool ReadAt(const std::string& answer, std::size_t offset, Structure& structure)
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

// Adds up the regions after a head of `headSize` bytes. Returns nothing if the answer is too short.
template <typename Region, typename Local>
Bytes LocalMemory(const std::string& answer, std::size_t headSize, std::size_t count, Local local)
{
    Bytes total = 0;
    for (std::size_t i = 0; total && i != count; ++i) {
        Region region{};
        total = ReadAt(answer, headSize + i * sizeof region, region) ? Sum(total, local(region))
                                                                     : std::nullopt;
    }
    return count == 0 ? std::nullopt : total;
}

Bytes ParseI915(const std::string& answer)
{
    drm_i915_query_memory_regions head; // not {}: it ends in a zero-size array, an extension
    if (!ReadAt(answer, 0, head))
        return std::nullopt;
    return LocalMemory<drm_i915_memory_region_info>(
        answer, sizeof head, head.num_regions, [](const drm_i915_memory_region_info& region) {
            return region.region.memory_class == I915_MEMORY_CLASS_DEVICE ? region.probed_size : 0;
        });
}

Bytes ParseXe(const std::string& answer)
{
    XeRegionsHead head{};
    if (!ReadAt(answer, 0, head))
        return std::nullopt;
    return LocalMemory<XeRegion>(
        answer, sizeof head, head.num_mem_regions, [](const XeRegion& region) {
            return region.mem_class == kXeClassVram ? region.total_size : 0;
        });
}

Bytes ParseRadeon(const std::string& answer)
{
    drm_radeon_gem_info info{};
    return ReadAt(answer, 0, info) ? Bytes(info.vram_size) : std::nullopt;
}

Bytes ParseNouveau(const std::string& answer)
{
    NouveauParameter parameter{};
    return ReadAt(answer, 0, parameter) && parameter.param == kNouveauFbSize
               ? Bytes(parameter.value)
               : std::nullopt;
}

struct Parser {
    const char* driver;
    Bytes (*parse)(const std::string& answer);
};

constexpr Parser kParsers[] = {
    {"i915", ParseI915},
    {"xe", ParseXe},
    {"radeon", ParseRadeon},
    {"nouveau", ParseNouveau},
};

} // namespace

std::optional<std::uint64_t> ParseDedicatedMemory(const std::string& driver,
                                                  const std::string& answer)
{
    const auto* const parser =
        std::find_if(std::begin(kParsers), std::end(kParsers),
                     [&](const Parser& candidate) { return candidate.driver == driver; });
    return parser == std::end(kParsers) ? std::nullopt : parser->parse(answer);
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
