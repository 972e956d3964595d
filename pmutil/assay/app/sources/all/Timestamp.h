// Timestamps of the report.
#pragma once

#include <ctime>
#include <string>

namespace assay {

// Formats a calendar time as local time, "YYYY-MM-DD_HH:MM:SS". Throws std::runtime_error "could
// not convert calendar time to local time".
std::string LocalTimeText(std::time_t calendarTime);

} // namespace assay
