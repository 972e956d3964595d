#include "pmutil/Threads.h"

#include <algorithm>

#include <boost/thread/thread.hpp>
#include <gmock/gmock.h>

#include "RecordingLogger.h"
#include "pmutil/System.h"

namespace pmutil {
namespace {

DebugValue gOn{"ThreadNamesTest.on", 1};

template <typename Function>
void OnNewThread(const Function& function)
{
    boost::thread thread(function);
    thread.join();
}

TEST(ThreadNamesTest, IDIsLowerCaseHexadecimalWithoutPrefix)
{
    EXPECT_EQ(MakeThreadIDString(1), "1");
    EXPECT_EQ(MakeThreadIDString(0xABCDEF), "abcdef");
    EXPECT_EQ(MakeThreadIDString(0x1f2E), "1f2e");
    EXPECT_EQ(MakeThreadIDString(~std::uint64_t{0}), "ffffffffffffffff");
}

TEST(ThreadNamesTest, IDZeroIsNotAnyThread)
{
    EXPECT_EQ(MakeThreadIDString(0), "{Not-any-thread}");
}

TEST(ThreadNamesTest, ThreadThatWasNeverNamedShowsItsID)
{
    OnNewThread([] {
        EXPECT_EQ(GetCurrentThreadIDString(), MakeThreadIDString(GetCurrentThreadNumber()));
        // The system may reuse the id of a thread of another test, which has a name.
        SetCurrentThreadName(GetCurrentThreadIDString());
    });
    EXPECT_EQ(GetCurrentThreadName(), GetCurrentThreadIDString());
    EXPECT_EQ(GetCurrentThreadIDString().find_first_not_of("0123456789abcdef"), std::string::npos);
}

TEST(ThreadNamesTest, NameBelongsToItsThread)
{
    const std::string before = GetCurrentThreadName();
    OnNewThread([] {
        SetCurrentThreadName("worker");
        EXPECT_EQ(GetCurrentThreadName(), "worker");
        EXPECT_NE(GetCurrentThreadIDString(), "worker");
    });
    EXPECT_EQ(GetCurrentThreadName(), before);
}

TEST(ThreadNamesTest, NamingTwiceKeepsTheLatestName)
{
    OnNewThread([] {
        SetCurrentThreadName("first");
        SetCurrentThreadName("second");
        EXPECT_EQ(GetCurrentThreadName(), "second");
        SetCurrentThreadName("");
        EXPECT_EQ(GetCurrentThreadName(), "");
    });
}

TEST(ThreadNamesTest, LongNamesAreKeptWhole)
{
    OnNewThread([] {
        const std::string name(1000, 'n');
        SetCurrentThreadName(name);
        EXPECT_EQ(GetCurrentThreadName(), name);
    });
}

TEST(ThreadNamesTest, LogLinesShowTheName)
{
    InitLogging();
    RecordingLogger logger;
    OnNewThread([] {
        SetCurrentThreadName("launcher");
        PM_LOG(gOn, "x");
    });
    PM_LOG(gOn, "y");
    ASSERT_THAT(logger.lines, testing::SizeIs(2));
    EXPECT_THAT(logger.lines[0], testing::EndsWith("[tid=launcher] x\n"));
    EXPECT_THAT(logger.lines[1], testing::EndsWith("[tid=" + GetCurrentThreadIDString() + "] y\n"));
}

TEST(ThreadNamesTest, ThreadsNameThemselvesAtOnce)
{
    boost::thread_group threads;
    for (int number = 0; number < 8; ++number)
        threads.create_thread([number] {
            for (int round = 0; round < 50; ++round) {
                const std::string name = std::to_string(number) + "." + std::to_string(round);
                SetCurrentThreadName(name);
                EXPECT_EQ(GetCurrentThreadName(), name);
            }
        });
    threads.join_all();
}

} // namespace
} // namespace pmutil
