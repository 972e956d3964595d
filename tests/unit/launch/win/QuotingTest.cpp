// Arguments on a Windows command line, against those that take one apart.
#include "win/Quoting.h"

#include <windows.h>

#include <shellapi.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <gtest/gtest.h>
#include <random>

#include <boost/nowide/convert.hpp>

#include "HexLines.h"
#include "TestChild.h"
#include "pmutil/RunProgram.h"

using namespace pmutil;

namespace {

using Texts = std::vector<std::wstring>;
using Tell = std::function<void(const std::wstring& text)>;

// The hard characters; of the last ones a command line's parser knows none.
const Texts kHard = {L" ", L"\t", L"\"", L"\\", L"\u00e9", L"%", L"^", L"\u65e5", L"\U0001F600"};
// One for each way in which a parser can take a character.
const Texts kKinds(kHard.begin(), kHard.begin() + 5);

bool IsLong()
{
    const char* const wanted = std::getenv("ASSAY_LONG_TESTS"); // NOLINT(concurrency-mt-unsafe):
                                                                // the environment is only read
    return wanted != nullptr && std::string(wanted) == "1";
}

void ForEachLonger(std::wstring& text, const Texts& parts, int length, const Tell& tell)
{
    tell(text);
    if (length == 0)
        return;
    const std::size_t size = text.size();
    for (const std::wstring& part : parts) {
        text += part;
        ForEachLonger(text, parts, length - 1, tell);
        text.resize(size);
    }
}

// Tells every text of up to `length` of the parts, the empty one included.
void ForEachText(const Texts& parts, int length, const Tell& tell)
{
    std::wstring text;
    ForEachLonger(text, parts, length, tell);
}

void ForRandomTexts(int count, int maxParts, const Tell& tell)
{
    std::mt19937 random(20260119);
    for (int round = 0; round < count; ++round) {
        std::wstring text;
        const auto parts = random() % static_cast<unsigned>(maxParts);
        for (unsigned part = 0; part < parts; ++part)
            text += random() % 4 == 0 ? std::wstring(1, static_cast<wchar_t>('a' + random() % 26))
                                      : kHard[random() % kHard.size()];
        tell(text);
    }
}

// Collects texts, and has them looked at together whenever a command line is full.
class Batch {
public:
    using Check = std::function<void(const Texts& texts)>;

    explicit Batch(Check check) : fCheck(std::move(check)) {}
    ~Batch()
    {
        Flush();
        std::printf("quoting: %lld texts on %lld command lines\n", fNumTexts, fNumLines);
    }
    Batch(const Batch&) = delete;
    Batch& operator=(const Batch&) = delete;

    void Add(const std::wstring& text)
    {
        constexpr std::size_t kMaxLine = 30'000;
        const std::size_t size = Quote(text).size() + 1;
        if (fSize + size > kMaxLine)
            Flush();
        fSize += size;
        fTexts.push_back(text);
    }

private:
    void Flush()
    {
        if (!fTexts.empty() && !testing::Test::HasFatalFailure()) {
            fCheck(fTexts);
            fNumTexts += static_cast<long long>(fTexts.size());
            ++fNumLines;
        }
        fSize = 0;
        fTexts.clear();
    }

    const Check fCheck;
    std::size_t fSize = 0;
    Texts fTexts;
    long long fNumTexts = 0;
    long long fNumLines = 0;
};

void CheckWithTheShell(const Texts& texts)
{
    std::wstring line = L"program";
    for (const std::wstring& text : texts)
        line += L' ' + Quote(text);
    int count = 0;
    wchar_t** const parsed = ::CommandLineToArgvW(line.c_str(), &count);
    ASSERT_NE(parsed, nullptr);
    const Texts received(parsed + 1, parsed + count);
    ::LocalFree(parsed);
    ASSERT_EQ(received, texts);
}

// By the way that clients launch.
void CheckWithAChild(const Texts& texts)
{
    std::vector<std::string> args = {"args"};
    for (const std::wstring& text : texts)
        args.push_back(boost::nowide::narrow(text));
    const RunResult run = RunProgram(boost::nowide::narrow(TEST_CHILD), args);
    ASSERT_EQ(run.fEnd, State::kFinished);
    args.erase(args.begin());
    if (run.fOutput != EncodeHexLines(args))
        ASSERT_EQ(DecodeHexLines(run.fOutput), args);
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

// The hard characters that aren't among the kinds are the same to a parser as the last kind. With
// ASSAY_LONG_TESTS=1 every text of eight is tried all the same, and by a child, which takes longer,
// every text of eight of the kinds and of six of the hard characters.
TEST(Quoting, TheShellReadsBackEveryText)
{
    Batch batch(CheckWithTheShell);
    const auto add = [&](const std::wstring& text) { batch.Add(text); };
    ForEachText(kKinds, 8, add);
    ForEachText(kHard, IsLong() ? 8 : 6, add);
    ForRandomTexts(20'000, 200, add);
}

TEST(Quoting, TheRuntimeOfAChildReadsBackEveryText)
{
    Batch batch(CheckWithAChild);
    const auto add = [&](const std::wstring& text) { batch.Add(text); };
    ForEachText(kKinds, IsLong() ? 8 : 6, add);
    ForEachText(kHard, IsLong() ? 6 : 4, add);
    ForRandomTexts(2'000, 200, add);
}

} // namespace
