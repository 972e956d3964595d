// How the system reports the number that a program's main returns.
#pragma once

#include <cstdint>

namespace assay_host {

// Returns the exit status that a waiting process receives for `returned`. Any thread may call.
std::int64_t GetReportedStatus(std::int32_t returned);

} // namespace assay_host
