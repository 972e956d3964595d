#include "pmutil/System.h"

#include <windows.h>

#include <cassert>
#include <cstdlib>
#include <exception>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "all/PathCodecvt.h"

using namespace pmutil;

namespace {

// From Windows' header of result codes, which are unsigned there.
constexpr int kAborted = static_cast<int>(0xC0000409);
constexpr int kAccessViolation = static_cast<int>(0xC0000005);

TEST(PathCodecvt, PathThatTheCodePageCannotSayFails)
{
    using boost::filesystem::path;
    EXPECT_EQ(path(L"C:\\plain.txt").string(GetPathCodecvt()), "C:\\plain.txt");
    EXPECT_EQ(path("C:\\plain.txt").wstring(GetPathCodecvt()), L"C:\\plain.txt");
    const wchar_t kNowhere[] = {L'C', L':', L'\\', 0xD83D, L'\0'}; // an unpaired surrogate
    try {
        path(kNowhere).string(GetPathCodecvt());
        FAIL() << "converted";
    } catch (const boost::system::system_error& error) {
        EXPECT_THAT(error.what(), testing::StartsWith("boost::filesystem::path codecvt to string"));
    }
}

// Each ends as a crash: neither with the status 3, which means a bad command line, nor in a dialog,
// which would never end.
TEST(PrepareConsoleProcessDeathTest, AbortIsACrash)
{
    const auto run = [](void (*fail)()) {
        PrepareConsoleProcess();
        fail();
    };
    EXPECT_EXIT(run([] { std::abort(); }), testing::ExitedWithCode(kAborted), "");
    EXPECT_EXIT(run([] { std::terminate(); }), testing::ExitedWithCode(kAborted), "");
    EXPECT_EXIT(run([] { assert(std::getenv("no such variable") != nullptr); }),
                testing::ExitedWithCode(kAborted), "");
}

TEST(PrepareConsoleProcessDeathTest, AccessViolationIsACrash)
{
    EXPECT_EXIT(
        {
            PrepareConsoleProcess();
            volatile int* volatile nowhere = nullptr;
            *nowhere = 1;
        },
        testing::ExitedWithCode(kAccessViolation), "");
}

// The process keeps its inherited mode; only the calling thread's mode changes.
TEST(PrepareConsoleProcessDeathTest, NothingAsksTheUser)
{
    EXPECT_EXIT(
        {
            ::SetErrorMode(0);
            PrepareConsoleProcess();
            const bool none = (::GetThreadErrorMode() & SEM_FAILCRITICALERRORS) != 0;
            ::ExitProcess(none ? ::GetErrorMode() : 99);
        },
        testing::ExitedWithCode(SEM_NOGPFAULTERRORBOX), "");
}

} // namespace
