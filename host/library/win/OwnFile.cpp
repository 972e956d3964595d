#include <windows.h>

#include <vector>

#include "library/OwnFile.h"

namespace assay_host {

namespace {

// An object of this file, whose address is in the module.
const char gMark = 0;

HMODULE GetOwnModule(DWORD flag)
{
    HMODULE module = nullptr;
    ::GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | flag,
                         reinterpret_cast<const wchar_t*>(&gMark), &module);
    return module;
}

} // namespace

boost::filesystem::path GetOwnFile()
{
    const HMODULE module = GetOwnModule(GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT);
    if (module == nullptr)
        return {};
    constexpr DWORD kMaxPath = 32768;
    std::vector<wchar_t> path(kMaxPath);
    const DWORD size = ::GetModuleFileNameW(module, path.data(), kMaxPath);
    return {path.begin(), path.begin() + size};
}

void KeepLoaded()
{
    static const HMODULE own = GetOwnModule(GET_MODULE_HANDLE_EX_FLAG_PIN);
    static_cast<void>(own);
}

} // namespace assay_host
