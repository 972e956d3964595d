#include "pmutil/OutputPump.h"

#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "TestChild.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/StartAwareApp.h"

using namespace pmutil;
using testing::ElementsAre;

namespace {

// The arguments of a function's calls.
class Taken {
public:
    TakeBytes Function()
    {
        return [this](std::string_view block) { fBlocks.emplace_back(block); };
    }

    std::vector<std::string> fBlocks;
};

// Runs a pump on a channel.
std::vector<std::string> Pump(std::deque<std::string> pieces)
{
    Taken taken;
    const auto channel = boost::make_shared<FakeChannel>();
    channel->fPieces = std::move(pieces);
    OutputPump pump(taken.Function());
    pump.Prepare(OutputChannel::kStdout, nullptr, channel);
    pump.Run();
    EXPECT_FALSE(channel->fOpen);
    return taken.fBlocks;
}

TEST(OutputPump, HandsOnBlocksAndTheEnd)
{
    EXPECT_THAT(Pump({"one", "two"}), ElementsAre("one", "two", ""));
    EXPECT_THAT(Pump({}), ElementsAre(""));
}

TEST(OutputPump, SaysTheEndAlsoWhereReadingFails)
{
    Taken taken;
    const auto channel = boost::make_shared<FakeChannel>();
    channel->fExcess = 1; // more than requested
    OutputPump pump(taken.Function());
    pump.Prepare(OutputChannel::kStdout, nullptr, channel);
    EXPECT_THROW(pump.Run(), std::logic_error);
    EXPECT_THAT(taken.fBlocks, ElementsAre(""));
}

TEST(OutputPump, CallsAFunctionThatFailedNoMore)
{
    int calls = 0;
    const auto channel = boost::make_shared<FakeChannel>();
    channel->fPieces = {"one", "two"};
    OutputPump pump([&](std::string_view) {
        ++calls;
        throw std::runtime_error("full");
    });
    pump.Prepare(OutputChannel::kStdout, nullptr, channel);
    EXPECT_TRUE(ThrowsRuntimeError("full", [&] { pump.Run(); }));
    EXPECT_EQ(calls, 1);
    EXPECT_FALSE(channel->fOpen);
}

std::vector<std::string> Lines(std::vector<std::string> blocks, std::size_t maxBytes = 1000)
{
    std::vector<std::string> lines;
    const TakeBytes take =
        ByLine([&](std::string_view line) { lines.emplace_back(line); }, maxBytes);
    for (const std::string& block : blocks)
        take(block);
    take({});
    return lines;
}

TEST(ByLine, CutsBlocksIntoLines)
{
    EXPECT_THAT(Lines({"one\ntwo\n"}), ElementsAre("one", "two"));
    EXPECT_THAT(Lines({"o", "ne\nt", "wo\n"}), ElementsAre("one", "two"));
    EXPECT_THAT(Lines({"\n\nthree\n"}), ElementsAre("", "", "three"));
    EXPECT_THAT(Lines({}), ElementsAre());
}

TEST(ByLine, TheLastLineNeedsNoEnd)
{
    EXPECT_THAT(Lines({"one\ntw", "o"}), ElementsAre("one", "two"));
}

TEST(ByLine, HandsALineOnWithItsEnd)
{
    std::vector<std::string> lines;
    const TakeBytes take = ByLine([&](std::string_view line) { lines.emplace_back(line); });
    take("one\ntw");
    EXPECT_THAT(lines, ElementsAre("one"));
    take("o\n");
    EXPECT_THAT(lines, ElementsAre("one", "two"));
}

TEST(ByLine, TakesBothKindsOfLineEnds)
{
    EXPECT_THAT(Lines({"one\r\ntwo\nthree\r", "\n\r\n"}), ElementsAre("one", "two", "three", ""));
    EXPECT_THAT(Lines({"a\rb\r\r\nc\r"}), ElementsAre("a\rb\r", "c\r")) << "others are bytes";
}

TEST(ByLine, CutsLongLinesIntoPieces)
{
    EXPECT_THAT(Lines({"abcdefgh\nij\n"}, 3), ElementsAre("abc", "def", "gh", "ij"));
    EXPECT_THAT(Lines({"a", "b", "c", "d", "e", "\n"}, 3), ElementsAre("abc", "de"));
    EXPECT_THAT(Lines({"abcdef"}, 3), ElementsAre("abc", "def"));
    EXPECT_THAT(Lines({"ab"}, 0), ElementsAre("a", "b")) << "a byte at least";
}

TEST(ByLine, AnEndBehindAFullPieceMakesNoLineOfItsOwn)
{
    for (const std::string end : {"\n", "\r\n"}) {
        EXPECT_THAT(Lines({"abc" + end + "d" + end}, 3), ElementsAre("abc", "d"));
        EXPECT_THAT(Lines({"abcdef" + end, end}, 3), ElementsAre("abc", "def", ""));
        std::vector<std::string> bytes;
        for (const char byte : "abcdef" + end)
            bytes.emplace_back(1, byte);
        EXPECT_THAT(Lines(bytes, 3), ElementsAre("abc", "def"));
    }
}

TEST(ByLine, CopiesShareTheBegunLine)
{
    std::vector<std::string> lines;
    const TakeBytes take = ByLine([&](std::string_view line) { lines.emplace_back(line); });
    const TakeBytes copy = take; // NOLINT(performance-unnecessary-copy-initialization)
    take("on");
    copy("e\n");
    EXPECT_THAT(lines, ElementsAre("one"));
}

class PumpedLaunch : public ConsoleAppFixture {
protected:
    // Makes pumps for channels that are at their end.
    PumpedLaunch()
    {
        for (const auto& [channel, pump] :
             {std::pair{OutputChannel::kStdout, fOut}, {OutputChannel::kStderr, fErr}})
            fParams.SetOutputTask(channel, pump);
    }

    TakeBytes CountEnd()
    {
        return [this](std::string_view block) { fEnds += block.empty() ? 1 : 0; };
    }

    std::atomic<int> fEnds{0};
    boost::shared_ptr<OutputPump> fOut = boost::make_shared<OutputPump>(CountEnd());
    boost::shared_ptr<OutputPump> fErr = boost::make_shared<OutputPump>(CountEnd());
};

TEST_F(PumpedLaunch, PumpsStayUntilTheStartIsOver)
{
    fApp->fOnEvent = [gate = fGate](const std::string& event) {
        if (event == "OnRunning")
            gate->Await();
    };
    Launch();
    EXPECT_TRUE(Eventually([&] { return fEnds == 2; }));
    EXPECT_TRUE(fOut->IsRunning(0.0));
    EXPECT_TRUE(fErr->IsRunning(0.0));
    fGate->Open();
    EXPECT_TRUE(Eventually([&] { return !fOut->IsRunning(0.0) && !fErr->IsRunning(0.0); }));
    fLauncher->End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    EXPECT_EQ(fApp->Events().at(3), "OnRunning");
}

TEST_F(PumpedLaunch, PumpsEndWithAStartThatFails)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    fApp->fThrowIn = "OnRunning";
    try {
        Launch();
        fApp->Wait(nullptr, kLong);
        ADD_FAILURE() << "nothing failed";
    } catch (const consoleapp::Exception& exc) {
        EXPECT_STREQ(exc.what(), "Launcher: OnRunning failed");
    }
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads) << "nothing was given up";
    EXPECT_TRUE(fLauncher->AwaitKills(1));
}

TEST_F(PumpedLaunch, AFunctionThatFailsIsAFailureOfItsChannel)
{
    // The child ends here, because Launch or Wait fails, whichever sees the failure first.
    const auto pump = boost::make_shared<OutputPump>([this](std::string_view) {
        fLauncher->End(kEndedNormally);
        throw std::runtime_error("full");
    });
    fParams.SetOutputTask(OutputChannel::kStderr, pump);
    // If the failure comes before Launch returns, Launch awaits the child's end.
    fLauncher->fOnLaunch = [this] { fLauncher->fEnded = true; };
    std::string failure;
    try {
        Launch();
        fApp->Wait(nullptr, kLong);
    } catch (const consoleapp::Exception& exc) {
        failure = exc.what();
    }
    EXPECT_EQ(failure, "stderr: full");
    EXPECT_EQ(fApp->CountEvents("OnRunning"), 1) << "the start doesn't suffer";
}

// The way of a client, with a child that ends before the launch checks its tasks.
TEST(PumpedChild, MayCrashAtOnce)
{
    const LongShortWait longWait;
    for (int round = 0; round < 100; ++round) {
        std::string out;
        const auto app = boost::make_shared<StartAwareApp>();
        const auto take = [&](std::string_view block) { out += block; };
        ConsoleAppLauncher launcher;
        launcher.SetConsoleApp(app);
        launcher.SetLaunchParams(LaunchParams(boost::make_shared<OutputPump>(take),
                                              boost::make_shared<OutputPump>(TakeBytes()),
                                              {"out", "begun", "abort"}, TEST_CHILD));
        int exitCode = -1;
        ASSERT_EQ(launcher.LaunchAndWait(&exitCode, kLong), State::kCrashed) << "round " << round;
        EXPECT_EQ(out, "begun\n");
        EXPECT_EQ(exitCode, 0);
    }
}

} // namespace
