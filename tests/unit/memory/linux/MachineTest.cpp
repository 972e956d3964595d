#include "memory/Machine.h"

#include <gtest/gtest.h>

#include <csignal>
#include <ctime>
#include <fstream>
#include <iterator>
#include <limits>
#include <string>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

#include "memory/Envelope.h"

namespace assay_host {
namespace {

TEST(MachineTest, KnowsItself)
{
    const auto machine = MakeSystemMachine();
    const HostMark self = machine->GetSelf();
    EXPECT_EQ(self.fProcess, static_cast<std::uint64_t>(::getpid()));
    std::ifstream stat("/proc/self/stat");
    stat.ignore(std::numeric_limits<std::streamsize>::max(), ')'); // this program's name has none
    std::vector<std::string> fields{std::istream_iterator<std::string>(stat), {}};
    ASSERT_GT(fields.size(), 19U);
    EXPECT_EQ(std::to_string(self.fStart), fields[19]) << "the 22nd of all";
    EXPECT_EQ(self.fBoot.size(), 36u);
    std::string id;
    std::getline(std::ifstream("/etc/machine-id"), id);
    EXPECT_EQ(self.fMachine, id.empty() ? "" : MakeDigest("assay-host " + id));
    EXPECT_TRUE(machine->IsSameBoot(self.fBoot, self.fBoot));
    EXPECT_FALSE(machine->IsSameBoot(self.fBoot, "other"));
    EXPECT_EQ(self, machine->GetSelf());
    EXPECT_TRUE(machine->IsAlive(self));
    const std::int64_t before = std::time(nullptr);
    const std::int64_t time = machine->GetTime();
    EXPECT_LE(before, time);
    EXPECT_LE(time, static_cast<std::int64_t>(std::time(nullptr)));
}

TEST(MachineTest, AnotherProcessOfTheSameIdIsNotAlive)
{
    const auto machine = MakeSystemMachine();
    HostMark other = machine->GetSelf();
    --other.fStart;
    EXPECT_FALSE(machine->IsAlive(other));
    EXPECT_FALSE(machine->IsAlive({1ULL << 40, 1, "", ""}));
    EXPECT_FALSE(machine->IsAlive({}));
}

TEST(MachineTest, AProcessThatIsOnlyWaitedForIsNotAlive)
{
    const auto machine = MakeSystemMachine();
    int start[2];
    ASSERT_EQ(::pipe(start), 0);
    const ::pid_t child = ::fork();
    if (child == 0) {
        const HostMark self = machine->GetSelf();
        if (::write(start[1], &self.fStart, sizeof self.fStart) > 0)
            ::pause();
        ::_exit(0);
    }
    HostMark mark;
    mark.fProcess = static_cast<std::uint64_t>(child);
    ASSERT_EQ(::read(start[0], &mark.fStart, sizeof mark.fStart),
              static_cast<::ssize_t>(sizeof mark.fStart));
    EXPECT_TRUE(machine->IsAlive(mark));
    ::kill(child, SIGKILL);
    siginfo_t ended = {};
    ::waitid(P_PID, static_cast<::id_t>(child), &ended, WEXITED | WNOWAIT);
    EXPECT_FALSE(machine->IsAlive(mark));
    ::waitpid(child, nullptr, 0);
    EXPECT_FALSE(machine->IsAlive(mark));
    ::close(start[0]);
    ::close(start[1]);
}

} // namespace
} // namespace assay_host
