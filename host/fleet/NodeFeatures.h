// A feature file of a run, for the local source of Node Feature Discovery. docs/fleet.md has the
// features. Any thread may call.
#pragma once

#include <cstddef>
#include <ostream>
#include <string>
#include <string_view>

#include "report/Report.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Node Feature Discovery ignores a larger file.
constexpr std::size_t kMaxFeatureFileBytes = 65536;

// Writes the labels of the node, then the facts of each device as features without a label. A value
// that isn't known is left out. The text has at most kMaxFeatureFileBytes: what is beyond is left
// out, and its last line has the number. Doesn't check the stream for failures.
void WriteNodeFeatures(std::ostream& out, const Report& report, const RunOutcome& outcome);

// Returns the text as the value of a label: letters, digits, '-', '_' and '.', at most 63 of them,
// with a letter or a digit at both ends. Other characters become one '-'. May be empty.
std::string MakeLabelValue(std::string_view text);

} // namespace assay_host
