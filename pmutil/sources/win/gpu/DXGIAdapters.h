// Raw adapters by DXGI.
#pragma once

#include <memory>

#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

// Makes a factory by CreateDXGIFactory. Fails with HRESULT_FROM_WIN32(ERROR_MOD_NOT_FOUND) if the
// system has no dxgi.dll.
ResultCode MakeDXGIAdapterFactory(std::unique_ptr<AdapterFactory>& factory);

} // namespace pmutil
