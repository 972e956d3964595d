#include "pmutil/UTF8Console.h"

#include <windows.h>

#include <gtest/gtest.h>

using namespace pmutil;

namespace {

constexpr UINT kBefore = 850;
constexpr UINT kOther = 437;

// Redirects standard output to a console of this process. The process loses its former streams, so
// that each test does this in a new process and reports by its status.
void TakeConsole()
{
    ::FreeConsole();
    ::AllocConsole();
    ::SetStdHandle(STD_OUTPUT_HANDLE, ::CreateFileW(L"CONOUT$", GENERIC_READ | GENERIC_WRITE,
                                                    FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                                    OPEN_EXISTING, 0, nullptr));
    ::SetStdHandle(STD_ERROR_HANDLE, nullptr);
    ::SetConsoleOutputCP(kBefore);
}

struct CodePages {
    UINT before = 0;
    UINT during = 0;
    UINT after = 0;
};

void EndWith(const CodePages& pages, const CodePages& expected)
{
    ::ExitProcess(pages.before == expected.before && pages.during == expected.during &&
                          pages.after == expected.after
                      ? 0
                      : 1);
}

TEST(UTF8ConsoleDeathTest, ShowsUTF8AndGetsItsCodePageBack)
{
    const auto run = [] {
        TakeConsole();
        CodePages pages;
        pages.before = ::GetConsoleOutputCP();
        {
            const UTF8Console console;
            pages.during = ::GetConsoleOutputCP();
        }
        pages.after = ::GetConsoleOutputCP();
        EndWith(pages, {kBefore, CP_UTF8, kBefore});
    };
    EXPECT_EXIT(run(), testing::ExitedWithCode(0), "");
}

TEST(UTF8ConsoleDeathTest, IsPutBackOnce)
{
    const auto run = [] {
        TakeConsole();
        CodePages pages;
        {
            const UTF8Console console;
            pages.before = ::GetConsoleOutputCP();
            UTF8Console::Restore();
            pages.during = ::GetConsoleOutputCP();
            ::SetConsoleOutputCP(kOther); // changed by another process from here on
        }
        pages.after = ::GetConsoleOutputCP();
        EndWith(pages, {CP_UTF8, kBefore, kOther});
    };
    EXPECT_EXIT(run(), testing::ExitedWithCode(0), "");
}

TEST(UTF8ConsoleDeathTest, ConsoleThatNothingIsWrittenToIsLeftAlone)
{
    const auto run = [] {
        TakeConsole();
        ::SetStdHandle(STD_OUTPUT_HANDLE, nullptr);
        CodePages pages;
        pages.before = ::GetConsoleOutputCP();
        const UTF8Console console;
        pages.during = pages.after = ::GetConsoleOutputCP();
        EndWith(pages, {kBefore, kBefore, kBefore});
    };
    EXPECT_EXIT(run(), testing::ExitedWithCode(0), "");
}

} // namespace
