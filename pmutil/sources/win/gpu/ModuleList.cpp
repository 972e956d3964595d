#include "all/gpu/ModuleList.h"

#include <algorithm>
#include <atomic>

#include <windows.h>

#include <psapi.h>

namespace pmutil {

namespace {

std::atomic<std::uint64_t> gLoads{0};

// Called under the loader's lock, where it may use nothing outside this module.
void CALLBACK CountLoad(ULONG reason, const void*, void*)
{
    constexpr ULONG kLoaded = 1; // LDR_DLL_NOTIFICATION_REASON_LOADED
    if (reason == kLoaded)
        gLoads.fetch_add(1, std::memory_order_relaxed);
}

// Returns false if the system has no such notification.
bool RegisterCount()
{
    using Register =
        LONG(WINAPI*)(ULONG, void(CALLBACK*)(ULONG, const void*, void*), void*, void**);
    const HMODULE ntdll = GetModuleHandleW(L"ntdll.dll");
    const auto proc = ntdll == nullptr ? nullptr
                                       : reinterpret_cast<Register>(reinterpret_cast<void*>(
                                             GetProcAddress(ntdll, "LdrRegisterDllNotification")));
    void* cookie = nullptr;
    return proc != nullptr && proc(0, CountLoad, nullptr, &cookie) == 0;
}

std::string ToUtf8(const wchar_t* text, DWORD length)
{
    const int size = WideCharToMultiByte(CP_UTF8, 0, text, static_cast<int>(length), nullptr, 0,
                                         nullptr, nullptr);
    std::string utf8(static_cast<std::size_t>(std::max(size, 0)), '\0');
    WideCharToMultiByte(CP_UTF8, 0, text, static_cast<int>(length), utf8.data(), size, nullptr,
                        nullptr);
    return utf8;
}

} // namespace

std::vector<std::string> ListModules()
{
    constexpr DWORD kMaxModules = 4096;
    constexpr DWORD kMaxPath = 1U << 15;
    std::vector<HMODULE> modules(kMaxModules);
    DWORD bytes = 0;
    if (!K32EnumProcessModules(GetCurrentProcess(), modules.data(),
                               static_cast<DWORD>(modules.size() * sizeof(HMODULE)), &bytes))
        return {};
    modules.resize(std::min<std::size_t>(modules.size(), bytes / sizeof(HMODULE)));
    std::vector<std::string> paths;
    std::vector<wchar_t> path(kMaxPath);
    for (const HMODULE module : modules) {
        const DWORD length = GetModuleFileNameW(module, path.data(), kMaxPath);
        // Windows allows no control character in a path.
        if (length > 0 && length < kMaxPath)
            paths.push_back(ToUtf8(path.data(), length));
    }
    return paths;
}

std::uint64_t CountLoads() noexcept
{
    static const bool isCounting = RegisterCount();
    return isCounting ? gLoads.load(std::memory_order_relaxed) : gLoads.fetch_add(1);
}

LastError::LastError() noexcept : fValue(GetLastError()) {}

LastError::~LastError()
{
    SetLastError(fValue);
}

} // namespace pmutil
