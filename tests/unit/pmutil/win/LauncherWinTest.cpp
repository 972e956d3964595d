#include "pmutil/LauncherWin.h"

#include <gtest/gtest.h>

#include "../Throws.h"

using namespace pmutil;

namespace {

std::wstring Line(const std::string& arg)
{
    return LauncherWin::MakeCommandLine(L"p", {arg});
}

TEST(LauncherWin, EveryArgumentIsQuoted)
{
    EXPECT_EQ(LauncherWin::MakeCommandLine(L"p", {}), L"p");
    EXPECT_EQ(Line("plain"), L"p \"plain\"");
    EXPECT_EQ(Line("with blank"), L"p \"with blank\"");
    EXPECT_EQ(Line(""), L"p \"\"");
    EXPECT_EQ(LauncherWin::MakeCommandLine(L"C:\\a b", {"c", "d"}), L"C:\\a b \"c\" \"d\"");
}

TEST(LauncherWin, QuotesInsideArguments)
{
    EXPECT_EQ(Line("a\"b"), L"p 'a\"b'") << "apostrophes spare the escape";
    EXPECT_EQ(Line("a'b"), L"p \"a'b\"");
    EXPECT_EQ(Line("a'b\"c"), L"p \"a'b\\\"c\"");
    EXPECT_EQ(Line("a\\b\\"), L"p \"a\\b\\\"") << "backslashes stay single";
}

TEST(LauncherWin, BytesAreSignExtended)
{
    EXPECT_EQ(Line("\xE4"), std::wstring(L"p \"") + static_cast<wchar_t>(0xFFE4) + L'"');
}

TEST(LauncherWin, CodesFrom256OnAreCrashes)
{
    LauncherWin launcher;
    for (const auto& [code, result, expected] :
         {std::tuple{"255", kEndedNormally, 255}, {"300", kEndedByCrash, -1}}) {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", code});
        int exitCode = -1;
        EXPECT_EQ(launcher.Wait(&exitCode), result);
        EXPECT_EQ(exitCode, expected);
    }
}

TEST(LauncherWin, TellsTheRawExitCode)
{
    const struct {
        const char* code;
        std::uint32_t raw;
        const char* text;
    } kRows[] = {
        {"255", 255, ""},
        {"256", 256, "code 0x00000100"},
        {"-1073741819", 0xC0000005, "code 0xC0000005"},
    };
    LauncherWin launcher;
    EXPECT_EQ(launcher.GetRawExitCode(), 0U) << "no child yet";
    for (const auto& row : kRows) {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", row.code});
        int exitCode = -1;
        launcher.Wait(&exitCode);
        EXPECT_EQ(launcher.GetRawExitCode(), row.raw);
        EXPECT_EQ(GetTerminationText(launcher), row.text);
    }
}

TEST(LauncherWin, KilledChildLeavesTheCodeAlone)
{
    LauncherWin launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"sleep", "60000"});
    launcher.Kill();
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedByKill);
    EXPECT_EQ(exitCode, -1);
    launcher.Kill();
}

TEST(LauncherWin, MissingProgram)
{
    LauncherWin launcher;
    EXPECT_TRUE(ThrowsRuntimeError("CreateProcessW failed",
                                   [&] { launcher.Launch(L"C:\\nonexistent\\p.exe", {}); }));
}

} // namespace
