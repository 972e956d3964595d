// What a system makes of the number that a program's main returns.
#pragma once

#include <cstdint>

namespace assay_host {

// The status that whoever waits for the program is given.
std::int64_t GetReportedStatus(std::int32_t returned);

} // namespace assay_host
