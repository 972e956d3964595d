#include "supervise/ProcessTree.h"

#include <windows.h>

#include <chrono>
#include <cstdint>
#include <set>
#include <thread>
#include <vector>

namespace assay_host {

namespace {

constexpr std::chrono::milliseconds kPause{2};
constexpr UINT kKilledCode = 257;

// The job that this process and all that descends from it belong to; null where the system doesn't
// allow one. It ends what is left in it when this process ends, however that comes.
HANDLE GetJob()
{
    static const HANDLE job = []() -> HANDLE {
        const HANDLE made = ::CreateJobObjectW(nullptr, nullptr);
        if (made == nullptr)
            return nullptr;
        JOBOBJECT_EXTENDED_LIMIT_INFORMATION limits = {};
        limits.BasicLimitInformation.LimitFlags = JOB_OBJECT_LIMIT_KILL_ON_JOB_CLOSE;
        ::SetInformationJobObject(made, JobObjectExtendedLimitInformation, &limits, sizeof limits);
        if (::AssignProcessToJobObject(made, ::GetCurrentProcess()) == 0) {
            ::CloseHandle(made);
            return nullptr;
        }
        return made;
    }();
    return job;
}

// The processes of the job but this one.
std::set<DWORD> ListProcesses(HANDLE job)
{
    constexpr std::size_t kMaxProcesses = 4096;
    std::vector<std::uint64_t> memory(1 + kMaxProcesses);
    auto* const list = reinterpret_cast<JOBOBJECT_BASIC_PROCESS_ID_LIST*>(memory.data());
    std::set<DWORD> result;
    if (::QueryInformationJobObject(job, JobObjectBasicProcessIdList, list,
                                    static_cast<DWORD>(memory.size() * sizeof memory[0]),
                                    nullptr) == 0)
        return result;
    for (DWORD index = 0; index < list->NumberOfProcessIdsInList; ++index)
        result.insert(static_cast<DWORD>(list->ProcessIdList[index]));
    result.erase(::GetCurrentProcessId());
    return result;
}

// While the handle is open, the number stays that process's; whether it is in the job is asked
// then.
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

class ProcessTree::Platform {
public:
    Platform() : fJob(GetJob())
    {
        if (fJob != nullptr)
            fBefore = ListProcesses(fJob);
    }

    bool EndAll(double seconds)
    {
        if (fJob == nullptr)
            return true;
        const auto deadline =
            std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
        for (;;) {
            bool left = false;
            for (const DWORD process : ListProcesses(fJob)) {
                if (fBefore.count(process) != 0)
                    continue;
                left = true;
                End(fJob, process);
            }
            if (!left)
                return true;
            if (std::chrono::steady_clock::now() >= deadline)
                return false;
            std::this_thread::sleep_for(kPause);
        }
    }

private:
    HANDLE fJob;
    std::set<DWORD> fBefore;
};

ProcessTree::ProcessTree() : fPlatform(std::make_unique<Platform>()) {}
ProcessTree::~ProcessTree() = default;

bool ProcessTree::EndAll(double seconds)
{
    return fPlatform->EndAll(seconds);
}

} // namespace assay_host
