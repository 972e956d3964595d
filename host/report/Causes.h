// What a child's log says of failures.
#pragma once

#include <string>
#include <string_view>

namespace assay_host {

// The cause that the text of a log line tells, without the words that the report line of the
// failure says itself; empty if the line is about no failure.
std::string FindCauseText(std::string_view text);

} // namespace assay_host
