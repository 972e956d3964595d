#include "win/Quoting.h"

#include <windows.h>

#include <shellapi.h>

#include <functional>
#include <gtest/gtest.h>
#include <random>
#include <sstream>

#include <boost/nowide/convert.hpp>

#include "TestChild.h"
#include "pmutil/ChildCommand.h"
#include "pmutil/LauncherWin.h"

namespace pmutil {
namespace {

using Texts = std::vector<std::wstring>;

// Difficult characters. The last ones have no meaning to a parser of command lines.
const Texts kHard = {L" ", L"\t", L"\"", L"\\", L"\u00e9", L"%", L"^", L"\u65e5", L"\U0001F600"};
// One character for each way in which a parser can treat it.
const Texts kKinds(kHard.begin(), kHard.begin() + 5);

// Calls `act` with every text of up to `length` parts, including the empty one.
void ForEachText(const Texts& parts, int length,
                 const std::function<void(const std::wstring&)>& act)
{
    Texts texts = {L""};
    act(L"");
    for (int round = 0; round < length; ++round) {
        Texts longer;
        longer.reserve(texts.size() * parts.size());
        for (const std::wstring& text : texts) {
            for (const std::wstring& part : parts) {
                longer.push_back(text + part);
                act(longer.back());
            }
        }
        texts.swap(longer);
    }
}

void ForRandomTexts(int count, int maxParts, const std::function<void(const std::wstring&)>& act)
{
    std::mt19937 random(20260119);
    for (int round = 0; round < count; ++round) {
        std::wstring text;
        const auto parts = random() % static_cast<unsigned>(maxParts);
        for (unsigned part = 0; part < parts; ++part)
            text += random() % 4 == 0 ? std::wstring(1, static_cast<wchar_t>('a' + random() % 26))
                                      : kHard[random() % kHard.size()];
        act(text);
    }
}

// Collects texts, and checks them together when a command line is full.
class Batch {
public:
    using Check = std::function<void(const std::wstring& line, const Texts& texts)>;

    explicit Batch(Check check) : fCheck(std::move(check)) {}
    ~Batch() { Flush(); }
    Batch(const Batch&) = delete;
    Batch& operator=(const Batch&) = delete;

    void Add(const std::wstring& text)
    {
        constexpr std::size_t kMaxLine = 30'000;
        const std::wstring quoted = Quote(text);
        if (fLine.size() + quoted.size() > kMaxLine)
            Flush();
        fLine += L' ' + quoted;
        fTexts.push_back(text);
    }

private:
    void Flush()
    {
        if (!fTexts.empty())
            fCheck(fLine, fTexts);
        fLine.clear();
        fTexts.clear();
    }

    const Check fCheck;
    std::wstring fLine;
    Texts fTexts;
};

void CheckWithTheShell(const std::wstring& line, const Texts& texts)
{
    int count = 0;
    wchar_t** const parsed = ::CommandLineToArgvW((L"program" + line).c_str(), &count);
    ASSERT_NE(parsed, nullptr);
    const Texts received(parsed + 1, parsed + count);
    ::LocalFree(parsed);
    ASSERT_EQ(received, texts);
}

std::string ReadRest(Reader& reader)
{
    std::string all;
    char block[4096];
    while (const auto count = reader.ReadSome(block, sizeof block))
        all.append(block, count);
    return all;
}

Texts DecodeLines(const std::string& hexadecimal)
{
    Texts result;
    std::istringstream lines(hexadecimal);
    for (std::string line; std::getline(lines, line);) {
        std::string text;
        for (std::size_t at = 0; at + 1 < line.size(); at += 2)
            text += static_cast<char>(std::stoi(line.substr(at, 2), nullptr, 16));
        result.push_back(boost::nowide::widen(text));
    }
    return result;
}

Texts LaunchTestChild(const std::wstring& program)
{
    LauncherWin launcher;
    const LaunchResult ends = launcher.Launch(program, {});
    const std::string out = ReadRest(*ends.fAppOutput[1]);
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedNormally);
    return DecodeLines(out);
}

void CheckWithAChild(const std::wstring& line, const Texts& texts)
{
    ASSERT_EQ(LaunchTestChild(Quote(TEST_CHILD) + L" args" + line), texts);
}

TEST(Quoting, DoublesOnlyTheBackslashesThatNeedIt)
{
    EXPECT_EQ(Quote(L""), L"\"\"");
    EXPECT_EQ(Quote(L"a b"), L"\"a b\"");
    EXPECT_EQ(Quote(L"C:\\a\\b"), L"\"C:\\a\\b\"");
    EXPECT_EQ(Quote(L"a\\"), L"\"a\\\\\"");
    EXPECT_EQ(Quote(L"a\"b"), L"\"a\\\"b\"");
    EXPECT_EQ(Quote(L"a\\\"b"), L"\"a\\\\\\\"b\"");
}

// The hard characters that aren't among the kinds are the same to a parser as the last kind.
TEST(Quoting, TheShellReadsBackEveryText)
{
    Batch batch(CheckWithTheShell);
    const auto add = [&](const std::wstring& text) { batch.Add(text); };
    ForEachText(kKinds, 8, add);
    ForEachText(kHard, 6, add);
    ForRandomTexts(20'000, 200, add);
}

TEST(Quoting, TheRuntimeOfAChildReadsBackEveryText)
{
    Batch batch(CheckWithAChild);
    const auto add = [&](const std::wstring& text) { batch.Add(text); };
    ForEachText(kKinds, 6, add);
    ForEachText(kHard, 4, add);
    ForRandomTexts(2'000, 200, add);
}

TEST(ChildCommand, HoldsTheWholeCommandLine)
{
    const ChildCommand command = MakeChildCommand("C:\\a folder\\p\u00e9.exe", {"", "a\"b", "c\\"});
    EXPECT_EQ(command.fProgram, L"\"C:\\a folder\\p\u00e9.exe\" \"\" \"a\\\"b\" \"c\\\\\"");
    EXPECT_TRUE(command.fArgs.empty());
}

TEST(ChildCommand, ReachesTheChildAsItIs)
{
    const ChildCommand command =
        MakeChildCommand(boost::nowide::narrow(TEST_CHILD),
                         {"args", "-stdout=a\\", "-exit=5", "-comment=a\"b", "\u00e9"});
    EXPECT_EQ(LaunchTestChild(command.fProgram),
              (Texts{L"-stdout=a\\", L"-exit=5", L"-comment=a\"b", L"\u00e9"}));
}

} // namespace
} // namespace pmutil
