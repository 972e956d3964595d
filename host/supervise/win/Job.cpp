#include "supervise/win/Job.h"

#include <chrono>
#include <cstdint>
#include <thread>
#include <vector>

namespace assay_host {

namespace {

constexpr std::chrono::milliseconds kPause{2};
constexpr UINT kKilledCode = 257;

HANDLE MakeOwnJob()
{
    const HANDLE made = MakeKillingJob();
    if (made == nullptr || ::AssignProcessToJobObject(made, ::GetCurrentProcess()) != 0)
        return made;
    ::CloseHandle(made);
    return nullptr;
}

// The process id isn't reused while the handle is open, so the membership is tested after opening.
void End(HANDLE job, DWORD process)
{
    const HANDLE handle =
        ::OpenProcess(PROCESS_TERMINATE | PROCESS_QUERY_INFORMATION, FALSE, process);
    if (handle == nullptr)
        return;
    BOOL inJob = FALSE;
    if (::IsProcessInJob(handle, job, &inJob) != 0 && inJob != FALSE)
        ::TerminateProcess(handle, kKilledCode);
    ::CloseHandle(handle);
}

} // namespace

HANDLE MakeKillingJob()
{
    const HANDLE made = ::CreateJobObjectW(nullptr, nullptr);
    if (made == nullptr)
        return nullptr;
    JOBOBJECT_EXTENDED_LIMIT_INFORMATION limits = {};
    limits.BasicLimitInformation.LimitFlags = JOB_OBJECT_LIMIT_KILL_ON_JOB_CLOSE;
    if (::SetInformationJobObject(made, JobObjectExtendedLimitInformation, &limits,
                                  sizeof limits) != 0)
        return made;
    ::CloseHandle(made);
    return nullptr;
}

HANDLE GetOwnJob()
{
    static const HANDLE job = MakeOwnJob();
    return job;
}

std::optional<std::set<DWORD>> ListProcesses(HANDLE job)
{
    std::vector<std::uint64_t> memory(64);
    for (;;) {
        auto* const list = reinterpret_cast<JOBOBJECT_BASIC_PROCESS_ID_LIST*>(memory.data());
        if (::QueryInformationJobObject(job, JobObjectBasicProcessIdList, list,
                                        static_cast<DWORD>(memory.size() * sizeof memory[0]),
                                        nullptr) != 0) {
            std::set<DWORD> result;
            for (DWORD index = 0; index < list->NumberOfProcessIdsInList; ++index)
                result.insert(static_cast<DWORD>(list->ProcessIdList[index]));
            result.erase(::GetCurrentProcessId());
            return result;
        }
        if (::GetLastError() != ERROR_MORE_DATA)
            return std::nullopt;
        memory.resize(2 * memory.size());
    }
}

bool EndNewProcesses(HANDLE job, const std::set<DWORD>& before, double seconds)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
    for (;;) {
        const std::optional<std::set<DWORD>> processes = ListProcesses(job);
        bool left = !processes;
        for (const DWORD process : processes.value_or(std::set<DWORD>())) {
            if (before.count(process) != 0)
                continue;
            left = true;
            End(job, process);
        }
        if (!left)
            return true;
        if (std::chrono::steady_clock::now() >= deadline)
            return false;
        std::this_thread::sleep_for(kPause);
    }
}

} // namespace assay_host
