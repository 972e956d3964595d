// A box plot in one line of ASCII characters.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace assay_host {

// Draws at least one sample, all finite, from the smallest at the left to the largest at the right:
// "|---[==#====]------|     o". "#" is the median, "[" and "]" are the quartiles, "|" the samples
// farthest from the median that aren't outliers, "o" outliers. `width`: characters, at least 1. Any
// thread may call.
std::string MakeTextPlot(const std::vector<double>& samples, std::size_t width);

} // namespace assay_host
