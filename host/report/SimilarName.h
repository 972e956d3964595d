// Finds what a user may have meant. Any thread may call.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

// Returns the name that is the most similar to what was written, regardless of case; the first one
// of several; empty if none is similar.
std::string FindSimilarName(std::string_view written, const std::vector<std::string>& names);

} // namespace assay_host
