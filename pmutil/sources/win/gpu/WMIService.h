// The management service through WMI.
#pragma once

#include <memory>

#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

std::unique_ptr<ManagementService> MakeWMIService();

} // namespace pmutil
