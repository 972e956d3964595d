// The management service by WMI.
#pragma once

#include <memory>

#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

// Makes an unconnected service. Never null.
std::unique_ptr<ManagementService> MakeWMIService();

} // namespace pmutil
