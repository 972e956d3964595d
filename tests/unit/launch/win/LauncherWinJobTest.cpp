// Children of LauncherWin in a job.
#include "pmutil/LauncherWin.h"

#include <windows.h>

#include <gtest/gtest.h>

#include "TestChild.h"
#include "Throws.h"
#include "support/OpenThings.h"
#include "win/ReplacedImport.h"

using namespace pmutil;

namespace {

class LauncherWinJob : public testing::Test {
protected:
    ~LauncherWinJob() override
    {
        ::TerminateJobObject(fJob, 1);
        ::CloseHandle(fJob);
    }

    // How many processes ever were members of the job.
    DWORD CountMembers() const
    {
        JOBOBJECT_BASIC_ACCOUNTING_INFORMATION counts = {};
        EXPECT_NE(::QueryInformationJobObject(fJob, JobObjectBasicAccountingInformation, &counts,
                                              sizeof counts, nullptr),
                  0);
        return counts.TotalProcesses;
    }

    // Runs a child to its end.
    void ExpectRuns()
    {
        LauncherWin launcher(fJob);
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "7"});
        int exitCode = -1;
        EXPECT_EQ(launcher.Wait(&exitCode), kEndedNormally);
        EXPECT_EQ(exitCode, 7);
        EXPECT_EQ(CountMembers(), 1U);
    }

    const HANDLE fJob = ::CreateJobObjectW(nullptr, nullptr);
};

const auto gUpdateProcThreadAttribute = __imp_UpdateProcThreadAttribute;

// As before Windows 10.
BOOL WINAPI SetNoJob(LPPROC_THREAD_ATTRIBUTE_LIST list, DWORD flags, DWORD_PTR attribute,
                     PVOID value, SIZE_T size, PVOID previous, PSIZE_T returned)
{
    if (attribute == PROC_THREAD_ATTRIBUTE_HANDLE_LIST)
        return gUpdateProcThreadAttribute(list, flags, attribute, value, size, previous, returned);
    ::SetLastError(ERROR_NOT_SUPPORTED);
    return FALSE;
}

BOOL WINAPI AssignNone(HANDLE, HANDLE)
{
    ::SetLastError(ERROR_ACCESS_DENIED);
    return FALSE;
}

// There is no moment at which the child exists and isn't a member.
TEST_F(LauncherWinJob, ChildIsCreatedInIt)
{
    const ReplacedImport replaced(__imp_AssignProcessToJobObject, &AssignNone);
    ExpectRuns();
}

TEST_F(LauncherWinJob, ChildEntersItWhereNoneIsCreatedInOne)
{
    const ReplacedImport replaced(__imp_UpdateProcThreadAttribute, &SetNoJob);
    ExpectRuns();
}

TEST_F(LauncherWinJob, ChildThatCannotEnterItIsEnded)
{
    const ReplacedImport attribute(__imp_UpdateProcThreadAttribute, &SetNoJob);
    const ReplacedImport assigned(__imp_AssignProcessToJobObject, &AssignNone);
    LauncherWin launcher(fJob);
    const auto before = CountOpenThings();
    EXPECT_TRUE(ThrowsRuntimeError("AssignProcessToJobObject failed", [&] {
        launcher.Launch(TEST_CHILD, {"sleep", "60000"});
    }));
    EXPECT_EQ(CountOpenThings(), before) << "no handle of the child's is left";
    EXPECT_EQ(CountMembers(), 0U);
}

} // namespace
