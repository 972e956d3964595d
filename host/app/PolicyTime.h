// Times of the policy from the command line.
#pragma once

#include <algorithm>
#include <cstdint>

#include "memory/Policy.h"

namespace assay_host {

// Returns `count` units in seconds, at most a hundred years. `count` is finite and at least 0.
inline std::int64_t ToSeconds(double count, std::int64_t unit)
{
    constexpr double kMaxSeconds = 100.0 * 365 * Policy::kDay;
    return static_cast<std::int64_t>(std::min(count * static_cast<double>(unit), kMaxSeconds));
}

} // namespace assay_host
