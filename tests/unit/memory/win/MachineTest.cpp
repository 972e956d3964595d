#include "memory/Machine.h"

#include <gtest/gtest.h>
#include <windows.h>

#include <ctime>

namespace assay_host {
namespace {

TEST(MachineTest, KnowsItself)
{
    const auto machine = MakeSystemMachine();
    const HostMark self = machine->GetSelf();
    EXPECT_EQ(self.fProcess, ::GetCurrentProcessId());
    EXPECT_NE(self.fStart, 0u);
    EXPECT_TRUE(machine->IsAlive(self));
    const HostMark again = machine->GetSelf();
    EXPECT_EQ(again.fStart, self.fStart);
    EXPECT_EQ(again.fMachine, self.fMachine);
    EXPECT_TRUE(machine->IsSameBoot(again.fBoot, self.fBoot));
    const std::int64_t before = std::time(nullptr);
    const std::int64_t time = machine->GetTime();
    EXPECT_LE(before, time);
    EXPECT_LE(time, static_cast<std::int64_t>(std::time(nullptr)));
}

// The start of the system is computed from two clocks, and one of them may be set a little.
TEST(MachineTest, ABootIsTheSameWithinTwoMinutes)
{
    const auto machine = MakeSystemMachine();
    EXPECT_TRUE(machine->IsSameBoot("1800000000", "1800000120"));
    EXPECT_TRUE(machine->IsSameBoot("1800000120", "1800000000"));
    EXPECT_FALSE(machine->IsSameBoot("1800000000", "1800000121"));
    EXPECT_FALSE(machine->IsSameBoot("1800000121", "1800000000"));
}

TEST(MachineTest, AnotherProcessOfTheSameIdIsNotAlive)
{
    const auto machine = MakeSystemMachine();
    HostMark other = machine->GetSelf();
    --other.fStart;
    EXPECT_FALSE(machine->IsAlive(other));
    EXPECT_FALSE(machine->IsAlive({}));
}

TEST(MachineTest, AProcessIsAliveUntilItEnds)
{
    wchar_t line[] = L"cmd.exe /c exit 0";
    STARTUPINFOW start = {};
    start.cb = sizeof start;
    PROCESS_INFORMATION child = {};
    ASSERT_NE(::CreateProcessW(nullptr, line, nullptr, nullptr, FALSE,
                               CREATE_SUSPENDED | CREATE_NO_WINDOW, nullptr, nullptr, &start,
                               &child),
              0);
    FILETIME created = {};
    FILETIME other = {};
    ASSERT_NE(::GetProcessTimes(child.hProcess, &created, &other, &other, &other), 0);
    HostMark mark;
    mark.fProcess = child.dwProcessId;
    mark.fStart = static_cast<std::uint64_t>(created.dwHighDateTime) << 32 | created.dwLowDateTime;
    const auto machine = MakeSystemMachine();
    EXPECT_TRUE(machine->IsAlive(mark));
    ::TerminateProcess(child.hProcess, 1);
    ::WaitForSingleObject(child.hProcess, INFINITE);
    // The process is kept as long as somebody has a handle of it.
    EXPECT_FALSE(machine->IsAlive(mark));
    ::CloseHandle(child.hThread);
    ::CloseHandle(child.hProcess);
    EXPECT_FALSE(machine->IsAlive(mark));
}

} // namespace
} // namespace assay_host
