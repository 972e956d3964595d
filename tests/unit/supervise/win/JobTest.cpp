#include "supervise/win/Job.h"

#include <gtest/gtest.h>
#include <vector>

#include "TestChild.h"

namespace assay_host {
namespace {

constexpr double kPatience = 20;

// A job with children that sleep. The destructor kills them.
class Job {
public:
    explicit Job(int children) : fHandle(::CreateJobObjectW(nullptr, nullptr))
    {
        std::wstring line = L"\"" + std::wstring(GetTestChild()) + L"\" sleep 60000";
        for (int count = 0; count < children; ++count) {
            STARTUPINFOW startup = {};
            startup.cb = sizeof startup;
            PROCESS_INFORMATION process = {};
            EXPECT_NE(::CreateProcessW(nullptr, line.data(), nullptr, nullptr, FALSE,
                                       CREATE_SUSPENDED, nullptr, nullptr, &startup, &process),
                      0);
            EXPECT_NE(::AssignProcessToJobObject(fHandle, process.hProcess), 0);
            fProcesses.push_back(process);
        }
    }
    ~Job()
    {
        ::TerminateJobObject(fHandle, 1);
        for (const PROCESS_INFORMATION& process : fProcesses) {
            ::CloseHandle(process.hThread);
            ::CloseHandle(process.hProcess);
        }
        ::CloseHandle(fHandle);
    }
    Job(const Job&) = delete;
    Job& operator=(const Job&) = delete;

    HANDLE GetHandle() const { return fHandle; }
    std::size_t CountListed() const { return ListProcesses(fHandle).value().size(); }

private:
    static std::wstring GetTestChild()
    {
        const std::string path = TEST_CHILD;
        return {path.begin(), path.end()};
    }

    const HANDLE fHandle;
    std::vector<PROCESS_INFORMATION> fProcesses;
};

TEST(Job, ListsAnyNumberOfProcesses)
{
    EXPECT_EQ(Job(0).CountListed(), 0U);
    EXPECT_EQ(Job(3).CountListed(), 3U);
    EXPECT_EQ(Job(70).CountListed(), 70U) << "more than the first buffer holds";
}

TEST(Job, FailedQueryIsNotAnEmptyList)
{
    const HANDLE noJob = ::CreateEventW(nullptr, TRUE, FALSE, nullptr);
    EXPECT_EQ(ListProcesses(noJob), std::nullopt);
    EXPECT_FALSE(EndNewProcesses(noJob, {}, 0));
    ::CloseHandle(noJob);
}

TEST(Job, EndsNewProcesses)
{
    const Job job(3);
    const std::set<DWORD> all = ListProcesses(job.GetHandle()).value();
    const std::set<DWORD> before = {*all.begin()};
    EXPECT_TRUE(EndNewProcesses(job.GetHandle(), before, kPatience));
    EXPECT_EQ(ListProcesses(job.GetHandle()), before);
}

} // namespace
} // namespace assay_host
