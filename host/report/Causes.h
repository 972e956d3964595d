// Finds the causes of failures in a child's log.
#pragma once

#include <string>
#include <string_view>

namespace assay_host {

// Returns the cause of a failure in the text of a log line, without the part that only names the
// failed operation; empty if the line isn't about a failure. Any thread may call.
std::string FindCauseText(std::string_view text);

} // namespace assay_host
