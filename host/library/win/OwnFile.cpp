#include <windows.h>

#include <vector>

#include "library/DefaultProgram.h"

namespace assay_host {

namespace {

// An object of this file, whose address is in the module.
const char gMark = 0;

} // namespace

boost::filesystem::path GetOwnFile()
{
    HMODULE module = nullptr;
    if (::GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS |
                                 GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                             reinterpret_cast<const wchar_t*>(&gMark), &module) == 0)
        return {};
    constexpr DWORD kMaxPath = 32768;
    std::vector<wchar_t> path(kMaxPath);
    const DWORD size = ::GetModuleFileNameW(module, path.data(), kMaxPath);
    return {path.begin(), path.begin() + size};
}

} // namespace assay_host
