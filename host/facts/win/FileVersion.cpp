#include "facts/FileVersion.h"

#include <cstring>

#include <boost/nowide/convert.hpp>
#include <fmt/format.h>

#include "facts/win/FixedInfo.h"

namespace assay_host {

namespace {

// The place of VS_FIXEDFILEINFO in a version resource: after three words and the key
// "VS_VERSION_INFO", at a multiple of four bytes (the documentation of VS_VERSIONINFO).
constexpr DWORD kFixedInfoOffset = 40;

bool FindFixedInfo(HMODULE file, VS_FIXEDFILEINFO& info)
{
    const HRSRC resource = ::FindResourceW(file, MAKEINTRESOURCEW(VS_VERSION_INFO),
                                           MAKEINTRESOURCEW(16)); // RT_VERSION
    if (resource == nullptr || ::SizeofResource(file, resource) < kFixedInfoOffset + sizeof info)
        return false;
    const HGLOBAL loaded = ::LoadResource(file, resource);
    const void* const data = loaded != nullptr ? ::LockResource(loaded) : nullptr;
    if (data == nullptr)
        return false;
    std::memcpy(&info, static_cast<const char*>(data) + kFixedInfoOffset, sizeof info);
    return info.dwSignature == 0xFEEF04BD;
}

} // namespace

// Without version.dll, which could be planted beside the program.
std::optional<VS_FIXEDFILEINFO> ReadFixedInfo(const std::string& path)
{
    const HMODULE file =
        ::LoadLibraryExW(boost::nowide::widen(path).c_str(), nullptr,
                         LOAD_LIBRARY_AS_DATAFILE | LOAD_LIBRARY_AS_IMAGE_RESOURCE);
    VS_FIXEDFILEINFO info = {};
    const bool found = file != nullptr && FindFixedInfo(file, info);
    if (file != nullptr)
        ::FreeLibrary(file);
    return found ? std::optional(info) : std::nullopt;
}

Fact GetFileVersion(const std::string& path)
{
    const auto info = ReadFixedInfo(path);
    if (!info)
        return {{}, "its file has none"};
    return {fmt::format("{}.{}.{}", HIWORD(info->dwFileVersionMS), LOWORD(info->dwFileVersionMS),
                        HIWORD(info->dwFileVersionLS)),
            {}};
}

} // namespace assay_host
