#include "output/WriterThread.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <condition_variable>
#include <future>
#include <mutex>
#include <stdexcept>
#include <thread>

namespace assay_host {
namespace {

using std::chrono::milliseconds;
using testing::ElementsAre;
using testing::IsEmpty;

// A reader of an output that can stop reading.
struct Reader {
    void Stop() { SetReads(false); }
    void Resume() { SetReads(true); }

    void Take(std::string_view text)
    {
        std::unique_lock<std::mutex> lock(fMutex);
        ++fAsked;
        fCond.notify_all();
        fCond.wait(lock, [this] { return fReads; });
        fTaken.emplace_back(text);
    }

    void AwaitAsked(int times)
    {
        std::unique_lock<std::mutex> lock(fMutex);
        fCond.wait(lock, [&] { return fAsked >= times; });
    }

    std::vector<std::string> GetTaken()
    {
        const std::lock_guard<std::mutex> lock(fMutex);
        return fTaken;
    }

    std::string GetAllTaken()
    {
        std::string all;
        for (const std::string& piece : GetTaken())
            all += piece;
        return all;
    }

    std::atomic<bool> fFinished{false};
    std::atomic<bool> fAbandoned{false};
    std::promise<void> fGone; // the output is destroyed

private:
    void SetReads(bool reads)
    {
        const std::lock_guard<std::mutex> lock(fMutex);
        fReads = reads;
        fCond.notify_all();
    }

    std::mutex fMutex;
    std::condition_variable fCond;
    std::vector<std::string> fTaken;
    bool fReads = true;
    int fAsked = 0;
};

class TestOutput : public Output {
public:
    explicit TestOutput(std::shared_ptr<Reader> reader) : fReader(std::move(reader)) {}

    void Open() override { fIsOpen = true; }
    void Write(std::string_view text) override
    {
        EXPECT_TRUE(fIsOpen);
        if (text.substr(0, 3) == "bad")
            throw std::runtime_error("no room");
        fReader->Take(text);
    }
    void Finish() override { fReader->fFinished = true; }
    void Abandon() override { fReader->fAbandoned = true; }
    ~TestOutput() override { fReader->fGone.set_value(); }

private:
    bool fIsOpen = false;
    const std::shared_ptr<Reader> fReader;
};

class WriterThreadTest : public testing::Test {
protected:
    // A thread that is blocked must not outlive the test.
    ~WriterThreadTest() override { fReader->Resume(); }

    std::shared_ptr<Reader> fReader = std::make_shared<Reader>();
    std::shared_ptr<std::atomic<int>> fFailures = std::make_shared<std::atomic<int>>(0);
    WriterThread fWriter{std::make_unique<TestOutput>(fReader),
                         [failures = fFailures] { ++*failures; }};
};

TEST_F(WriterThreadTest, WritesInOrder)
{
    fWriter.Write("one");
    fWriter.Write([] { return std::string("two"); });
    fWriter.Write("three");
    fWriter.Write(std::string());
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_THAT(fReader->GetTaken(), ElementsAre("one", "two", "three"));
    EXPECT_TRUE(fReader->fFinished);
    EXPECT_EQ(*fFailures, 0);
    fWriter.Abandon();
    EXPECT_FALSE(fReader->fAbandoned); // the output was finished before
}

TEST_F(WriterThreadTest, DoesNotBlockItsCallers)
{
    fReader->Stop();
    for (int line = 0; line < 10000; ++line)
        fWriter.Write("a line");
    fReader->AwaitAsked(1);
    EXPECT_THAT(fReader->GetTaken(), IsEmpty());
    fReader->Resume();
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_EQ(fReader->GetAllTaken().size(), 10000 * std::string("a line").size());
}

// What waits to be written is written in as few pieces as it fits in.
TEST_F(WriterThreadTest, JoinsShortTextsThatWait)
{
    fReader->Stop();
    fWriter.Write("taken");
    fReader->AwaitAsked(1);
    fWriter.Write(std::string(4000, 'a'));
    fWriter.Write(std::string(96, 'b'));
    fWriter.Write("c");
    fWriter.Write([] { return std::string("made"); });
    fWriter.Write("d");
    fWriter.WriteLarge([](std::ostream& out) { out << "large"; });
    fWriter.Write("e");
    fWriter.Write("f");
    fWriter.WriteError("");
    fWriter.Write(std::string(3000, 'g'));
    fWriter.Write(std::string(3000, 'h'));
    fReader->Resume();
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_THAT(fReader->GetTaken(),
                ElementsAre("taken", std::string(4000, 'a') + std::string(96, 'b'), "c", "made",
                            "d", "large", "ef", std::string(3000, 'g'), std::string(3000, 'h')));
}

TEST_F(WriterThreadTest, GivesUpAReaderThatDoesNotRead)
{
    fReader->Stop();
    fWriter.Write("one");
    EXPECT_FALSE(fWriter.Finish(milliseconds(20)));
    fWriter.Abandon();
    EXPECT_TRUE(fReader->fAbandoned);
    EXPECT_FALSE(fReader->fFinished);
}

// Stops to read after many pieces, for which a writer needs longer than the patience below.
class TiringOutput : public Output {
public:
    static constexpr int kPieces = 100'000;

    explicit TiringOutput(std::shared_ptr<Reader> reader) : fReader(std::move(reader)) {}

    void Write(std::string_view text) override
    {
        if (++fPieces > kPieces)
            fReader->Take(text);
    }
    void Finish() override {}
    void Abandon() override {}

private:
    const std::shared_ptr<Reader> fReader;
    int fPieces = 0;
};

TEST(WriterThreadEndTest, GivesUpAReaderThatStopsWhileItWaits)
{
    const auto reader = std::make_shared<Reader>();
    reader->Stop();
    WriterThread writer(std::make_unique<TiringOutput>(reader), [] {});
    writer.WriteLarge([](std::ostream& out) {
        const std::string block(4096, 'x');
        for (int piece = 0; piece <= TiringOutput::kPieces; ++piece)
            out << block;
    });
    EXPECT_FALSE(writer.Finish(milliseconds(1)));
    writer.Abandon();
    reader->Resume();
}

// The thread holds the output, and waits for the next text when its owner goes.
TEST(WriterThreadEndTest, EndsAndLetsGoOfTheOutputWhenItIsAbandoned)
{
    const auto reader = std::make_shared<Reader>();
    auto writer = std::make_unique<WriterThread>(std::make_unique<TestOutput>(reader), [] {});
    writer->Write("one");
    reader->AwaitAsked(1);
    writer.reset();
    reader->fGone.get_future().wait();
    EXPECT_TRUE(reader->fAbandoned);
    EXPECT_FALSE(reader->fFinished);
}

TEST_F(WriterThreadTest, MakesATextJustBeforeItIsWritten)
{
    fReader->Stop();
    std::atomic<bool> made{false};
    fWriter.Write("one");
    fWriter.Write([&made] {
        made = true;
        return std::string("two");
    });
    fReader->AwaitAsked(1);
    EXPECT_FALSE(made);
    fReader->Resume();
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_TRUE(made);
}

TEST_F(WriterThreadTest, HoldsNoLargeTextWhole)
{
    fReader->Stop();
    std::atomic<int> lines{0};
    fWriter.WriteLarge([&lines](std::ostream& out) {
        for (; lines < 1000; ++lines)
            out << std::string(1000, 'x');
    });
    fReader->AwaitAsked(1);
    EXPECT_LT(lines, 1000);
    fReader->Resume();
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_EQ(fReader->GetAllTaken(), std::string(1000000, 'x'));
}

TEST_F(WriterThreadTest, WritesALongTextInPieces)
{
    const std::string text(10000, 'x');
    fWriter.Write(text);
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_THAT(fReader->GetTaken(),
                ElementsAre(text.substr(0, 4096), text.substr(4096, 4096), text.substr(8192)));
}

TEST_F(WriterThreadTest, ReportsAFailureOfALargeText)
{
    fWriter.WriteLarge([](std::ostream& out) { out << "bad"; });
    EXPECT_THROW(fWriter.Finish(std::nullopt), std::runtime_error);
}

TEST_F(WriterThreadTest, WritesLongErrorsWhole)
{
    const std::string text = std::string(10000, 'x') + "\n";
    testing::internal::CaptureStderr();
    fWriter.WriteError(text);
    EXPECT_TRUE(fWriter.Finish(std::nullopt));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), text);
}

class UnfinishedOutput : public Output {
public:
    void Write(std::string_view /*text*/) override {}
    void Finish() override { throw std::runtime_error("no room"); }
};

// Nobody needs to hear of it but the caller that waits.
TEST(WriterThreadEndTest, ReportsAFailureOfTheEndToItsCallerOnly)
{
    std::atomic<int> failures{0};
    WriterThread writer(std::make_unique<UnfinishedOutput>(), [&failures] { ++failures; });
    EXPECT_THROW(writer.Finish(std::nullopt), std::runtime_error);
    EXPECT_EQ(failures, 0);
}

TEST_F(WriterThreadTest, ReportsAFailureOnceAndThrowsItAtTheEnd)
{
    fWriter.Write("bad");
    fWriter.Write("one");
    while (*fFailures == 0)
        std::this_thread::sleep_for(milliseconds(1));
    fWriter.Write("two");
    EXPECT_THROW(fWriter.Finish(std::nullopt), std::runtime_error);
    EXPECT_EQ(*fFailures, 1);
    EXPECT_TRUE(fReader->fAbandoned); // the process may end before the output is destroyed
    EXPECT_THAT(fReader->GetTaken(), IsEmpty());
    EXPECT_FALSE(fReader->fFinished);
}

} // namespace
} // namespace assay_host
