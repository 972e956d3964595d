#include <algorithm>
#include <charconv>
#include <cstdint>
#include <iterator>
#include <locale>

#include <boost/algorithm/string/case_conv.hpp>
#include <fmt/format.h>

#include "bugreport/KernelLog.h"

namespace assay_host {

namespace {

// Parts of messages, in lower case: drivers and subsystems of the kernel. "gpu" is part of the
// names of some drivers.
constexpr std::string_view kParts[] = {
    "drm",       "radeon", "i915",     "intel_fb", "nouveau",      "nvidia",
    "nvrm",      "vgaarb", "vga ",     "gpu",      "kfd",          "vmwgfx",
    "vboxvideo", "qxl",    "mgag200",  "simplefb", "efifb",        "framebuffer",
    "panfrost",  "lima",   "etnaviv",  "msm_dpu",  "v3d",          "vc4",
    "tegra",     "asahi",  "xe 0000:", " assay[",  "assay-worker",
};

} // namespace

std::string ReadKernelRecord(std::string_view record)
{
    const std::size_t end = record.find(';');
    if (end == std::string_view::npos)
        return {};
    // Priority, number, microseconds, flags.
    const std::string_view prefix = record.substr(0, end);
    const std::size_t second = prefix.find(',', prefix.find(',') + 1);
    if (second == std::string_view::npos)
        return {};
    const std::string_view rest = prefix.substr(second + 1);
    std::uint64_t time = 0;
    const auto read = std::from_chars(rest.data(), rest.data() + rest.size(), time);
    if (read.ec != std::errc())
        return {};
    const std::string_view text = record.substr(end + 1);
    constexpr std::uint64_t kSecond = 1000000;
    return fmt::format("[{:5}.{:06}] {}", time / kSecond, time % kSecond,
                       text.substr(0, text.find('\n')));
}

bool IsGraphicsMessage(std::string_view line)
{
    const std::string lower =
        boost::algorithm::to_lower_copy(std::string(line), std::locale::classic());
    return std::any_of(std::begin(kParts), std::end(kParts), [&lower](std::string_view part) {
        return lower.find(part) != std::string::npos;
    });
}

std::vector<std::string> SelectGraphicsMessages(std::vector<std::string> lines)
{
    lines.erase(std::remove_if(lines.begin(), lines.end(),
                               [](const std::string& line) { return !IsGraphicsMessage(line); }),
                lines.end());
    const std::size_t count = std::min(lines.size(), kMaxKernelLines);
    lines.erase(lines.begin(), lines.end() - static_cast<std::ptrdiff_t>(count));
    return lines;
}

} // namespace assay_host
