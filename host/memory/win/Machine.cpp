#include "memory/Machine.h"

#include <windows.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <string>

#include <boost/nowide/convert.hpp>

#include "memory/Envelope.h"

namespace assay_host {

namespace {

// The system's start is computed from two clocks. Setting one moves it a little.
constexpr std::int64_t kBootTolerance = 120;

std::int64_t ReadClock()
{
    const std::int64_t now = std::chrono::duration_cast<std::chrono::seconds>(
                                 std::chrono::system_clock::now().time_since_epoch())
                                 .count();
    return std::clamp<std::int64_t>(now, 0, kLastTime);
}

// Returns when the process was started; 0 if it doesn't exist any more.
std::uint64_t GetStart(HANDLE process)
{
    FILETIME created = {};
    FILETIME exited = {};
    FILETIME kernel = {};
    FILETIME user = {};
    DWORD status = 0;
    if (::GetProcessTimes(process, &created, &exited, &kernel, &user) == 0 ||
        ::GetExitCodeProcess(process, &status) == 0 || status != STILL_ACTIVE)
        return 0;
    return static_cast<std::uint64_t>(created.dwHighDateTime) << 32 | created.dwLowDateTime;
}

std::string ReadMachineId()
{
    wchar_t id[64] = {};
    DWORD bytes = sizeof id - sizeof *id;
    if (::RegGetValueW(HKEY_LOCAL_MACHINE, L"SOFTWARE\\Microsoft\\Cryptography", L"MachineGuid",
                       RRF_RT_REG_SZ | RRF_SUBKEY_WOW6464KEY, nullptr, id, &bytes) != ERROR_SUCCESS)
        return {};
    return MakeDigest("assay-host " + boost::nowide::narrow(id));
}

class SystemMachine : public Machine {
public:
    std::int64_t GetTime() override { return ReadClock(); }

    HostMark GetSelf() override
    {
        HostMark self;
        self.fProcess = ::GetCurrentProcessId();
        self.fStart = GetStart(::GetCurrentProcess());
        self.fBoot =
            std::to_string(ReadClock() - static_cast<std::int64_t>(::GetTickCount64() / 1000));
        self.fMachine = ReadMachineId();
        return self;
    }

    bool IsAlive(const HostMark& host) override
    {
        const HANDLE process = ::OpenProcess(PROCESS_QUERY_LIMITED_INFORMATION, FALSE,
                                             static_cast<DWORD>(host.fProcess));
        if (process == nullptr)
            return false;
        const std::uint64_t start = GetStart(process);
        ::CloseHandle(process);
        return start != 0 && start == host.fStart;
    }

    bool IsSameBoot(const std::string& one, const std::string& other) override
    {
        const std::int64_t difference = std::atoll(one.c_str()) - std::atoll(other.c_str());
        return std::llabs(difference) <= kBootTolerance;
    }
};

} // namespace

std::unique_ptr<Machine> MakeSystemMachine()
{
    return std::make_unique<SystemMachine>();
}

} // namespace assay_host
