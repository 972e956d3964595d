// How the system reports the number that a program's main returns.
#pragma once

#include <cstdint>

namespace assay_host {

// The exit status that a waiting process gets.
std::int64_t GetReportedStatus(std::int32_t returned);

} // namespace assay_host
