#include "facts/FileVersion.h"

#include <vector>

#include <boost/nowide/convert.hpp>
#include <fmt/format.h>
#include <windows.h>

namespace assay_host {

Fact GetFileVersion(const std::string& path)
{
    const std::wstring wide = boost::nowide::widen(path);
    DWORD unused = 0;
    const DWORD size = ::GetFileVersionInfoSizeW(wide.c_str(), &unused);
    std::vector<char> data(size);
    void* block = nullptr;
    UINT blockSize = 0;
    if (size == 0 || !::GetFileVersionInfoW(wide.c_str(), 0, size, data.data()) ||
        !::VerQueryValueW(data.data(), L"\\", &block, &blockSize) ||
        blockSize < sizeof(VS_FIXEDFILEINFO))
        return {{}, "its file has none"};
    const auto* const info = static_cast<const VS_FIXEDFILEINFO*>(block);
    return {fmt::format("{}.{}.{}", HIWORD(info->dwFileVersionMS), LOWORD(info->dwFileVersionMS),
                        HIWORD(info->dwFileVersionLS)),
            {}};
}

} // namespace assay_host
