// The raw adapters through DXGI.
#pragma once

#include <memory>

#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

ResultCode MakeDXGIAdapterFactory(std::unique_ptr<AdapterFactory>& factory);

} // namespace pmutil
