#include "facts/Environment.h"

#include <chrono>
#include <string>

#include <boost/nowide/convert.hpp>
#include <fmt/format.h>
#include <windows.h>

#include "facts/TimeText.h"

namespace assay_host {

namespace {

constexpr wchar_t kVersionKey[] = L"SOFTWARE\\Microsoft\\Windows NT\\CurrentVersion";
constexpr DWORD kFirstBuildOf11 = 22000;

Fact MakeFact(std::string value, const char* reason)
{
    if (value.empty())
        return {{}, reason};
    return {std::move(value), {}};
}

std::string ReadVersionText(const wchar_t* name)
{
    wchar_t text[256] = {};
    DWORD size = sizeof(text) - sizeof(wchar_t);
    if (::RegGetValueW(HKEY_LOCAL_MACHINE, kVersionKey, name, RRF_RT_REG_SZ, nullptr, text,
                       &size) != ERROR_SUCCESS)
        return {};
    return boost::nowide::narrow(text);
}

std::string ReadRevision()
{
    DWORD revision = 0;
    DWORD size = sizeof(revision);
    if (::RegGetValueW(HKEY_LOCAL_MACHINE, kVersionKey, L"UBR", RRF_RT_REG_DWORD, nullptr,
                       &revision, &size) != ERROR_SUCCESS)
        return {};
    return "." + std::to_string(revision);
}

// Returns the real version: the other functions return an older one to programs without a manifest.
RTL_OSVERSIONINFOW GetKernelVersion()
{
    RTL_OSVERSIONINFOW version{};
    version.dwOSVersionInfoSize = sizeof(version);
    using Function = LONG(WINAPI*)(RTL_OSVERSIONINFOW*);
    const HMODULE library = ::GetModuleHandleW(L"ntdll.dll");
    const auto function = library ? reinterpret_cast<Function>(reinterpret_cast<void*>(
                                        ::GetProcAddress(library, "RtlGetVersion")))
                                  : nullptr;
    if (!function || function(&version) != 0)
        version.dwBuildNumber = 0;
    return version;
}

std::string GetArchitecture()
{
    SYSTEM_INFO info{};
    ::GetNativeSystemInfo(&info);
    switch (info.wProcessorArchitecture) {
    case PROCESSOR_ARCHITECTURE_AMD64:
        return "x86_64";
    case PROCESSOR_ARCHITECTURE_ARM64:
        return "aarch64";
    default:
        return {};
    }
}

std::string GetHostName()
{
    wchar_t name[256] = {};
    DWORD size = 256;
    return ::GetComputerNameExW(ComputerNamePhysicalDnsHostname, name, &size)
               ? boost::nowide::narrow(name)
               : std::string();
}

// Returns the offset of the local time from UTC in minutes.
int GetOffset()
{
    TIME_ZONE_INFORMATION zone{};
    const DWORD season = ::GetTimeZoneInformation(&zone);
    if (season == TIME_ZONE_ID_INVALID)
        return 0;
    const LONG bias = season == TIME_ZONE_ID_DAYLIGHT   ? zone.DaylightBias
                      : season == TIME_ZONE_ID_STANDARD ? zone.StandardBias
                                                        : 0;
    return static_cast<int>(-(zone.Bias + bias));
}

} // namespace

Environment GetEnvironment(bool identify)
{
    constexpr const char* kUntold = "Windows does not tell";
    Environment environment;
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    environment.fTime = MakeUtcText(std::chrono::duration_cast<std::chrono::seconds>(now).count());
    environment.fOffset = MakeOffsetText(GetOffset());

    const RTL_OSVERSIONINFOW version = GetKernelVersion();
    std::string product = ReadVersionText(L"ProductName");
    // The value says "Windows 10" on Windows 11 too.
    constexpr std::string_view kTen = "Windows 10";
    if (version.dwBuildNumber >= kFirstBuildOf11 && product.rfind(kTen, 0) == 0)
        product.replace(0, kTen.size(), "Windows 11");
    environment.fSystem = MakeFact(product, kUntold);
    environment.fBuild = MakeFact(
        version.dwBuildNumber ? std::to_string(version.dwBuildNumber) + ReadRevision() : "",
        kUntold);
    environment.fKernel =
        MakeFact(version.dwBuildNumber ? fmt::format("Windows NT {}.{}.{}", version.dwMajorVersion,
                                                     version.dwMinorVersion, version.dwBuildNumber)
                                       : "",
                 kUntold);
    environment.fArchitecture = MakeFact(GetArchitecture(), kUntold);
    environment.fHost =
        identify ? MakeFact(GetHostName(), kUntold) : Fact{{}, "only with --identify"};
    return environment;
}

} // namespace assay_host
