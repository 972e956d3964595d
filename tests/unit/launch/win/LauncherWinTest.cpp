#include "pmutil/LauncherWin.h"

#include <windows.h>

#include <cstdio>
#include <fstream>
#include <gmock/gmock.h>

#include <boost/filesystem/operations.hpp>

#include "RecordingLogger.h"
#include "TempFolder.h"
#include "TestChild.h"
#include "Throws.h"
#include "pmutil/WinHandle.h"
#include "support/OpenThings.h"
#include "support/Waits.h"
#include "win/ReplacedImport.h"

using namespace pmutil;
using testing::ElementsAre;

namespace {

std::wstring Line(const std::string& arg)
{
    return LauncherWin::MakeCommandLine(L"p", {arg});
}

std::string ReadRest(Reader& reader)
{
    std::string all;
    char block[4096];
    for (auto count = reader.ReadSome(block, sizeof block); count > 0;
         count = reader.ReadSome(block, sizeof block))
        all.append(block, count);
    return all;
}

struct Outcome {
    WaitResult result = kEndedNormally;
    int exitCode = -1;
    std::string out;
};

Outcome RunChild(const std::deque<std::string>& args, const std::wstring& program = TEST_CHILD)
{
    LauncherWin launcher;
    Outcome run;
    LaunchResult ends = launcher.Launch(program, args);
    ends.fAppInput.reset();
    run.out = ReadRest(*ends.fAppOutput[1]);
    run.result = launcher.Wait(&run.exitCode);
    return run;
}

// The arguments as the child's C runtime passes them to main.
std::vector<std::string> GetReceived(std::deque<std::string> args)
{
    args.emplace_front("args");
    std::istringstream lines(RunChild(args).out);
    std::vector<std::string> received;
    for (std::string line; std::getline(lines, line);) {
        std::string arg;
        for (std::size_t at = 0; at + 1 < line.size(); at += 2)
            arg += static_cast<char>(std::stoi(line.substr(at, 2), nullptr, 16));
        received.push_back(arg);
    }
    return received;
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

TEST(LauncherWin, PlainArgumentsArriveAsTheyAre)
{
    EXPECT_THAT(GetReceived({"plain", "with blank", "", "'", "a'b", "a\\b", "*", "\t"}),
                ElementsAre("plain", "with blank", "", "'", "a'b", "a\\b", "*", "\t"));
}

TEST(LauncherWin, ArgumentWithBothQuotesArrivesAsItIs)
{
    EXPECT_THAT(GetReceived({"a'b\"c", "next"}), ElementsAre("a'b\"c", "next"));
}

TEST(LauncherWin, ArgumentInApostrophesRunsIntoTheNext)
{
    // Apostrophes have no meaning to the runtime: the quotation mark between them opens a
    // quotation, which the next argument's first one closes.
    EXPECT_THAT(GetReceived({"a\"b", "next"}), ElementsAre("'ab' next"));
    EXPECT_THAT(GetReceived({"\"a\"", "next"}), ElementsAre("'a'", "next"));
}

TEST(LauncherWin, BackslashAtTheEndTakesTheQuotationMarkAlong)
{
    EXPECT_THAT(GetReceived({"a\\", "next"}), ElementsAre("a\" next"));
    EXPECT_THAT(GetReceived({"C:\\folder\\"}), ElementsAre("C:\\folder\""));
}

TEST(LauncherWin, EveryByteIsOnTheCommandLine)
{
    std::string every;
    for (int code = 1; code < 256; ++code)
        every += static_cast<char>(code);
    std::string expected;
    for (const wchar_t character : LauncherWin::MakeCommandLine(TEST_CHILD, {"line", every})) {
        char digits[5];
        std::snprintf(digits, sizeof digits, "%04x", static_cast<unsigned>(character));
        expected += digits;
    }
    EXPECT_EQ(RunChild({"line", every}).out, expected);
    EXPECT_THAT(expected, testing::HasSubstr("ff80ff81")) << "no code page converts them";
}

TEST(LauncherWin, LongArgumentArrives)
{
    const std::string fits(30'000, 'x'); // the whole line may have 32767 characters
    EXPECT_EQ(RunChild({"args", fits}).out.size(), 2 * fits.size() + 1);
}

TEST(LauncherWin, ArgumentOfAMillionCharactersFailsTheStart)
{
    if (::GetProcAddress(::GetModuleHandleW(L"ntdll.dll"), "wine_get_version") != nullptr)
        GTEST_SKIP() << "Wine cuts the command line that Windows refuses";
    LauncherWin launcher;
    EXPECT_TRUE(ThrowsRuntimeError("CreateProcessW failed", [&] {
        launcher.Launch(TEST_CHILD, {"args", std::string(1'000'000, 'x')});
    }));
}

TEST(LauncherWin, PathWithBlanksMustComeQuoted)
{
    const TempFolder folder;
    const auto copy = folder.Path() / "with blank" / "child copy.exe";
    boost::filesystem::create_directory(copy.parent_path());
    wchar_t child[MAX_PATH] = {};
    ASSERT_NE(::SearchPathW(nullptr, TEST_CHILD, nullptr, MAX_PATH, child, nullptr), 0U);
    boost::filesystem::copy_file(child, copy);
    EXPECT_EQ(RunChild({"exit", "7"}, L"\"" + copy.wstring() + L"\"").exitCode, 7);
}

TEST(LauncherWin, FailedStartsTellTheCall)
{
    const TempFolder folder;
    const auto text = folder.Path() / "text.exe";
    std::ofstream(text.string()) << "not a program\n";
    const auto empty = folder.Path() / "empty.exe";
    std::ofstream(empty.string());
    for (const std::wstring& program : {std::wstring(L"C:\\nonexistent\\p.exe"),
                                        folder.Path().wstring(), text.wstring(), empty.wstring()}) {
        LauncherWin launcher;
        EXPECT_TRUE(
            ThrowsRuntimeError("CreateProcessW failed", [&] { launcher.Launch(program, {}); }));
    }
}

TEST(LauncherWin, HostWithoutStandardInputCanLaunch)
{
    const HANDLE input = ::GetStdHandle(STD_INPUT_HANDLE);
    ::SetStdHandle(STD_INPUT_HANDLE, nullptr);
    const Outcome run = RunChild({"echo", "out", "fine", "exit", "3"});
    ::SetStdHandle(STD_INPUT_HANDLE, input);
    EXPECT_EQ(run.out, "fine\n");
    EXPECT_EQ(run.exitCode, 3);
}

TEST(LauncherWin, ParentKeepsItsEndsToItself)
{
    LauncherWin launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"echo"});
    const auto isInherited = [](const auto& end) {
        DWORD flags = HANDLE_FLAG_INHERIT;
        ::GetHandleInformation(dynamic_cast<const WinHandle&>(*end).GetHandle(), &flags);
        return (flags & HANDLE_FLAG_INHERIT) != 0;
    };
    EXPECT_FALSE(isInherited(ends.fAppInput));
    EXPECT_FALSE(isInherited(ends.fAppOutput[1]));
    EXPECT_FALSE(isInherited(ends.fAppOutput[2]));
    EXPECT_EQ(ends.fAppOutput[0], nullptr);
    // No other process holds the child's input open: it ends with the writer.
    ends.fAppInput->Close();
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedNormally);
}

const auto gCreatePipe = __imp_CreatePipe;
const auto gSetHandleInformation = __imp_SetHandleInformation;
int gCallsBeforeFailure = 0;

BOOL WINAPI CreateSomePipes(HANDLE* reader, HANDLE* writer, SECURITY_ATTRIBUTES* attributes,
                            DWORD size)
{
    return gCallsBeforeFailure-- > 0 ? gCreatePipe(reader, writer, attributes, size) : FALSE;
}

BOOL WINAPI SetSomeInformation(HANDLE handle, DWORD mask, DWORD flags)
{
    return gCallsBeforeFailure-- > 0 ? gSetHandleInformation(handle, mask, flags) : FALSE;
}

// Fails `text` at each of the three pipes.
void ExpectFailureAtEachPipe(const std::string& text)
{
    const DebugValueSetter log("BINIO_LOG", 1);
    for (int pipes = 0; pipes < 3; ++pipes) {
        const long before = CountOpenThings();
        const RecordingLogger recorder;
        LauncherWin launcher;
        gCallsBeforeFailure = pipes;
        EXPECT_TRUE(ThrowsRuntimeError(text, [&] { launcher.Launch(TEST_CHILD, {}); }));
        EXPECT_EQ(CountOpenThings(), before);
        int logged = 0;
        for (const std::string& line : recorder.lines)
            logged += MessageOf(line).rfind("childStd", 0) == 0 ? 1 : 0;
        EXPECT_EQ(logged, pipes);
    }
}

TEST(LauncherWin, FailedPipeClosesTheEndsMadeSoFar)
{
    const ReplacedImport replaced(__imp_CreatePipe, &CreateSomePipes);
    ExpectFailureAtEachPipe("CreatePipe failed");
}

TEST(LauncherWin, EndThatStaysInheritableFailsTheStart)
{
    const ReplacedImport replaced(__imp_SetHandleInformation, &SetSomeInformation);
    ExpectFailureAtEachPipe("SetHandleInformation failed");
}

TEST(LauncherWin, ChildInheritsItsPipesOnly)
{
    // Like the ends of another launch, in another thread, for its child.
    SECURITY_ATTRIBUTES inheritable = {};
    inheritable.nLength = sizeof inheritable;
    inheritable.bInheritHandle = TRUE;
    HANDLE readEnd = nullptr;
    HANDLE writeEnd = nullptr;
    ASSERT_NE(::CreatePipe(&readEnd, &writeEnd, &inheritable, 0), 0);
    const WinHandle reader(readEnd, true);
    const WinHandle writer(writeEnd, true);
    EXPECT_EQ(RunChild({"pipes"}).out, "pipes 3\n");
}

TEST(LauncherWin, HandlesOfTheProcessStayOpen)
{
    RunChild({"exit", "0"});
    const long before = CountOpenThings();
    for (int round = 0; round < 10; ++round)
        RunChild({"exit", "0"});
    const long kept = CountOpenThings() - before;
    EXPECT_LE(kept, 10 * kKeptPerLaunch);
    EXPECT_GT(kept, 9 * kKeptPerLaunch - 4) << "others may have been closed meanwhile";
}

TEST(LauncherWin, WaitAndKillWithoutALaunchFail)
{
    LauncherWin launcher;
    int exitCode = -1;
    EXPECT_TRUE(
        ThrowsRuntimeError("WaitForSingleObject failed", [&] { launcher.Wait(&exitCode); }));
    EXPECT_TRUE(ThrowsRuntimeError("TerminateProcess failed", [&] { launcher.Kill(); }));
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

} // namespace
