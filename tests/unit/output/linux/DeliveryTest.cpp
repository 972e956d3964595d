// How the output of an interrupted command ends.
#include "output/Delivery.h"

#include <gtest/gtest.h>

#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <string>

#include "supervise/InterruptNotes.h"
#include "supervise/RunTimes.h"

namespace assay_host {
namespace {

using std::chrono::milliseconds;

constexpr milliseconds kNoPatience{0};
constexpr milliseconds kLongPatience{1'000'000};
constexpr int kInterruptedStatus = 6;

// Nobody reads it.
class StuckOutput : public Output {
public:
    void Write(std::string_view /*text*/) override
    {
        std::unique_lock<std::mutex> lock(fMutex);
        fCond.wait(lock, [] { return false; });
    }
    void Finish() override {}
    void Abandon() override { std::fputs("abandoned\n", stderr); }

private:
    std::mutex fMutex;
    std::condition_variable fCond;
};

class ReadOutput : public Output {
public:
    void Write(std::string_view /*text*/) override {}
    void Finish() override {}
    void Abandon() override {}
};

// Ends the process with 0 if all is delivered. The output takes longer than the call.
[[noreturn]] void Deliver(std::unique_ptr<Output> output, int interrupts, milliseconds patience)
{
    DefaultRunTimes().fReaderPatience = patience;
    const auto writer = std::make_shared<WriterThread>(std::move(output), [] {});
    writer->WriteLarge([](std::ostream& out) {
        const std::string block(4096, 'x');
        for (int piece = 0; piece < 100'000; ++piece)
            out << block;
    });
    for (int count = 0; count < interrupts; ++count)
        NoteInterrupt();
    const Delivery delivery(writer);
    delivery.Finish();
    std::_Exit(0);
}

// Each case is a process of its own, which begins without threads.
class DeliveryTest : public testing::Test {
protected:
    DeliveryTest() { testing::FLAGS_gtest_death_test_style = "threadsafe"; }
    ~DeliveryTest() override { testing::FLAGS_gtest_death_test_style = fStyle; }

private:
    const std::string fStyle = testing::FLAGS_gtest_death_test_style;
};

TEST_F(DeliveryTest, WithoutAnInterruptNeedsNoPatience)
{
    EXPECT_EXIT(Deliver(std::make_unique<ReadOutput>(), 0, kNoPatience), testing::ExitedWithCode(0),
                "");
}

TEST_F(DeliveryTest, AfterAnInterruptWaitsForAReaderThatReads)
{
    EXPECT_EXIT(Deliver(std::make_unique<ReadOutput>(), 1, kLongPatience),
                testing::ExitedWithCode(0), "");
}

TEST_F(DeliveryTest, AfterAnInterruptGivesUpAReaderThatDoesNotRead)
{
    EXPECT_EXIT(Deliver(std::make_unique<StuckOutput>(), 1, milliseconds(1)),
                testing::ExitedWithCode(kInterruptedStatus), "^abandoned\n$");
}

TEST_F(DeliveryTest, AfterMoreInterruptsDoesNotWait)
{
    for (const int interrupts : {2, 3})
        EXPECT_EXIT(Deliver(std::make_unique<StuckOutput>(), interrupts, kLongPatience),
                    testing::ExitedWithCode(kInterruptedStatus), "^abandoned\n$");
}

TEST_F(DeliveryTest, EndsAtAnInterruptThatComesLater)
{
    EXPECT_EXIT(
        {
            const auto writer =
                std::make_shared<WriterThread>(std::make_unique<StuckOutput>(), [] {});
            const Delivery delivery(writer);
            NoteInterrupt();
        },
        testing::ExitedWithCode(kInterruptedStatus), "^abandoned\n$");
}

} // namespace
} // namespace assay_host
