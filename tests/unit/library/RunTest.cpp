// Runs of the library by its C interface, with the test child in place of assay.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "Runs.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

TEST(LibraryRun, AWholeReport)
{
    const ChildRun run(kWhole + Words{"err", "words"});
    ASSERT_EQ(run.fError, ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_result_verdict(run.fResult), ASSAY_HOST_COMPLETE);
    EXPECT_STREQ(assay_host_verdict_name(ASSAY_HOST_COMPLETE), "complete");
    int status = -1;
    EXPECT_EQ(assay_host_result_exit_status(run.fResult, &status), 1);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(assay_host_result_exit_status(run.fResult, nullptr), 1);
    EXPECT_STREQ(assay_host_result_termination(run.fResult), "");
    EXPECT_EQ(assay_host_result_left_behind(run.fResult), 0);
    EXPECT_GT(assay_host_result_seconds(run.fResult), 0);
    std::size_t size = 0;
    EXPECT_STREQ(assay_host_result_last_line(run.fResult, &size), "assayEnd=\"y\"");
    EXPECT_EQ(size, 12U);
    EXPECT_EQ(assay_host_result_error_line_count(run.fResult), 1U);
    EXPECT_STREQ(assay_host_result_error_line(run.fResult, 0, &size), "words");
    EXPECT_EQ(size, 5U);
    EXPECT_STREQ(assay_host_result_error_line(run.fResult, 1, &size), "");
    EXPECT_EQ(size, 0U);
}

// The stop ends the default program, if there is one, at its start.
TEST(LibraryRun, NullOptionsAreTheDefaults)
{
    assay_host_stop* const stop = assay_host_stop_new();
    assay_host_stop_raise(stop);
    assay_host_result* result = nullptr;
    ASSERT_EQ(assay_host_run(nullptr, stop, &result), ASSAY_HOST_OK);
    ASSERT_NE(result, nullptr);
    EXPECT_THAT(assay_host_result_verdict(result),
                testing::AnyOf(ASSAY_HOST_INTERRUPTED, ASSAY_HOST_NEVER_STARTED));
    assay_host_result_free(result);
    assay_host_stop_free(stop);
}

TEST(LibraryRun, EachVerdict)
{
    EXPECT_EQ(ChildRun({"exit", "7"}).GetVerdict(), ASSAY_HOST_FAILED_TESTS);
    EXPECT_EQ(ChildRun({"err", "usage: x", "exit", "3"}).GetVerdict(), ASSAY_HOST_USAGE_ERROR);
    const ChildRun crashed({"abort"});
    EXPECT_EQ(crashed.GetVerdict(), ASSAY_HOST_CRASHED);
    EXPECT_THAT(assay_host_result_termination(crashed.fResult),
                testing::AnyOf(StartsWith("signal "), StartsWith("code 0x")));
    EXPECT_EQ(assay_host_result_exit_status(crashed.fResult, nullptr), 0);
    Options options;
    assay_host_options_set_timeout(options, 0.2);
    const ChildRun hung({"sleep", "600000"}, options);
    EXPECT_EQ(hung.GetVerdict(), ASSAY_HOST_HUNG);
    EXPECT_GE(assay_host_result_seconds(hung.fResult), 0.2);
    EXPECT_THAT(assay_host_result_reason(hung.fResult), HasSubstr("0.2 s"));
    Options missing;
    EXPECT_EQ(assay_host_options_set_program(missing, "no-such-program"), ASSAY_HOST_OK);
    const ChildRun never({}, missing);
    EXPECT_EQ(never.GetVerdict(), ASSAY_HOST_NEVER_STARTED);
    EXPECT_THAT(assay_host_result_reason(never.fResult),
                HasSubstr("there is no file no-such-program"));
}

TEST(LibraryRun, AStopEndsARunFromAnotherThreadAndAllLaterOnes)
{
    assay_host_stop* const stop = assay_host_stop_new();
    Options options;
    options.OnLine([&](const std::string&) {
        std::thread(assay_host_stop_raise, stop).join();
        return 0;
    });
    const ChildRun run({"out", "begun", "sleep", "600000"}, options, stop);
    EXPECT_EQ(run.GetVerdict(), ASSAY_HOST_INTERRUPTED);
    EXPECT_EQ(ChildRun(kWhole, {}, stop).GetVerdict(), ASSAY_HOST_INTERRUPTED);
    assay_host_stop_free(stop);
}

TEST(LibraryRun, AStopIsForSeveralRuns)
{
    assay_host_stop* const stop = assay_host_stop_new();
    std::atomic<int> begun{0};
    std::atomic<int> interrupted{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 3; ++thread)
        threads.emplace_back([&] {
            Options options;
            options.OnLine([&](const std::string&) {
                if (++begun == 3)
                    assay_host_stop_raise(stop);
                return 0;
            });
            if (ChildRun({"out", "x", "sleep", "600000"}, options, stop).GetVerdict() ==
                ASSAY_HOST_INTERRUPTED)
                ++interrupted;
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(interrupted, 3);
    assay_host_stop_free(stop);
}

TEST(LibraryRun, CallbacksGetLinesAndTicksOnTheCallersThread)
{
    std::vector<std::string> lines;
    std::vector<std::string> errors;
    bool isOwnThread = true;
    const auto self = std::this_thread::get_id();
    Options options;
    options.OnLine([&](const std::string& line) {
        isOwnThread = isOwnThread && std::this_thread::get_id() == self;
        lines.push_back(line);
        return 0;
    });
    options.OnErrorLine([&](const std::string& line) {
        errors.push_back(line);
        return 0;
    });
    const ChildRun run(Words{"err", "e"} + kWhole, options);
    EXPECT_EQ(run.GetVerdict(), ASSAY_HOST_COMPLETE);
    EXPECT_THAT(lines, ElementsAre("assayStart=\"x\"", "assayEnd=\"y\""));
    EXPECT_THAT(errors, ElementsAre("e"));
    EXPECT_TRUE(isOwnThread);
}

TEST(LibraryRun, EachCallbackCanEndTheRunOnly)
{
    assay_host_stop* const stop = assay_host_stop_new();
    const Words endless = {"out", "Tester=x", "err", "e", "sleep", "600000"};
    Options byLine;
    byLine.OnLine([](const std::string&) { return 1; });
    EXPECT_EQ(ChildRun(endless, byLine, stop).GetVerdict(), ASSAY_HOST_INTERRUPTED);
    Options byError;
    byError.OnErrorLine([](const std::string&) { return 1; });
    EXPECT_EQ(ChildRun(endless, byError, stop).GetVerdict(), ASSAY_HOST_INTERRUPTED);
    Options byTick;
    std::string key;
    assay_host_options_on_tick(
        byTick,
        [](void* context, double seconds, std::uint64_t steps, const char* next) {
            *static_cast<std::string*>(context) = next;
            return seconds > 0 && steps < 100 && *next != '\0' ? 1 : 0;
        },
        &key);
    EXPECT_EQ(ChildRun(endless, byTick, stop).GetVerdict(), ASSAY_HOST_INTERRUPTED);
    EXPECT_THAT(key, testing::AnyOf("Tester", "assayStart"));
    EXPECT_EQ(ChildRun(kWhole, {}, stop).GetVerdict(), ASSAY_HOST_COMPLETE)
        << "the stop isn't raised";
    assay_host_stop_free(stop);
}

TEST(LibraryRun, LimitsDropAndCount)
{
    Options options;
    EXPECT_EQ(assay_host_options_set_max_lines(options, 1), ASSAY_HOST_OK);
    const ChildRun lines(kWhole, options);
    EXPECT_GE(assay_host_result_lost_bytes(lines.fResult), std::string("assayEnd=\"y\"").size());
    Options bytes;
    EXPECT_EQ(assay_host_options_set_max_bytes(bytes, 100000), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_set_max_line_bytes(bytes, 1000), ASSAY_HOST_OK);
    const ChildRun flood({"flood", "10000000"}, bytes);
    EXPECT_GE(assay_host_result_lost_bytes(flood.fResult), 10000000U - 1000U);
    const ChildRun errors({"flood-errors", "70000"});
    EXPECT_EQ(assay_host_result_lost_error_bytes(errors.fResult), 70000U - 65536U);
}

// Runs of 8 threads at once, each with a grandchild that must be ended too. Returns the number of
// those that ended as they should.
int RunByEightThreads(int runsOfEach)
{
    std::atomic<int> right{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 8; ++thread)
        threads.emplace_back([&, thread] {
            for (int run = 0; run < runsOfEach; ++run) {
                const ChildRun made(kWhole +
                                    Words{"spawn", "600000", "exit", std::to_string(thread)});
                int status = -1;
                assay_host_result_exit_status(made.fResult, &status);
                if (status == thread && assay_host_result_left_behind(made.fResult) == 0 &&
                    assay_host_result_document(made.fResult, nullptr) != nullptr)
                    ++right;
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    return right;
}

// The growth of memory, in KiB, that is no growth: pages that the heaps of 8 threads happen to
// have.
constexpr long kMaxGrowth = 1024;

void ExpectNoGrowth(int runsOfEach)
{
    EXPECT_EQ(RunByEightThreads(runsOfEach), 8 * runsOfEach);
    const Counts before = CountThings();
    const long memory = GetMemoryKiB();
    EXPECT_EQ(RunByEightThreads(runsOfEach), 8 * runsOfEach);
    EXPECT_EQ(CountAfter(8 * runsOfEach, before), before);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__) // they keep freed memory
    EXPECT_LE(GetMemoryKiB() - memory, kMaxGrowth) << "of memory in KiB";
#else
    static_cast<void>(memory);
#endif
}

TEST(LibraryRun, EightAtOnceLeaveNothing)
{
    EXPECT_EQ(RunByEightThreads(1), 8);
    const Counts before = CountThings();
    EXPECT_EQ(RunByEightThreads(4), 32);
    EXPECT_EQ(CountAfter(32, before), before);
}

TEST(LibraryRun, AThousandByEightThreadsLeaveNothing)
{
    if (std::getenv("ASSAY_LONG_TESTS") == nullptr)
        GTEST_SKIP() << "2000 runs take long: ASSAY_LONG_TESTS=1";
    ExpectNoGrowth(125);
}

// ASSAY_LONG_TESTS=1 sets the number of the requirement.
TEST(LibraryRun, ManyInARowLeaveNothing)
{
    const bool isLong = std::getenv("ASSAY_LONG_TESTS") != nullptr;
    const auto runOnce = [] {
        const ChildRun run(kWhole);
        ASSERT_EQ(run.GetVerdict(), ASSAY_HOST_COMPLETE);
        ASSERT_NE(assay_host_result_document(run.fResult, nullptr), nullptr);
    };
    for (int run = 0; run < 20; ++run)
        runOnce();
    const Counts before = CountThings();
    const long memory = GetMemoryKiB();
    const int runs = isLong ? 1000 : 50;
    for (int run = 0; run < runs; ++run)
        runOnce();
    EXPECT_EQ(CountAfter(runs, before), before);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__) // they keep freed memory
    EXPECT_LE(GetMemoryKiB() - memory, 1024) << "of memory in KiB";
#else
    static_cast<void>(memory);
#endif
}

TEST(LibraryErrors, ArgumentsOutOfRange)
{
    Options options;
    EXPECT_EQ(assay_host_options_set_program(options, ""), ASSAY_HOST_BAD_TEXT);
    EXPECT_EQ(assay_host_options_set_program(options, nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_add_argument(options, nullptr), ASSAY_HOST_NULL_POINTER);
    for (const double bad :
         {-1.0, std::numeric_limits<double>::infinity(), std::numeric_limits<double>::quiet_NaN()})
        EXPECT_EQ(assay_host_options_set_timeout(options, bad), ASSAY_HOST_BAD_VALUE);
    for (const auto set : {assay_host_options_set_max_bytes, assay_host_options_set_max_line_bytes,
                           assay_host_options_set_max_lines}) {
        EXPECT_EQ(set(options, 0), ASSAY_HOST_BAD_VALUE);
        EXPECT_EQ(set(options, (std::uint64_t{1} << 30) + 1), ASSAY_HOST_BAD_VALUE);
        EXPECT_EQ(set(options, std::uint64_t{1} << 30), ASSAY_HOST_OK);
        EXPECT_EQ(set(nullptr, 1), ASSAY_HOST_NULL_POINTER);
    }
    EXPECT_EQ(assay_host_run(options, nullptr, nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_stop_raise(nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_STREQ(assay_host_error_text(ASSAY_HOST_BAD_VALUE), "a value is out of its range");
    EXPECT_STREQ(assay_host_error_text(MakeNumber<assay_host_error>(8)), "unknown error");
    EXPECT_STREQ(assay_host_version(), ASSAY_VERSION);
}

TEST(LibraryErrors, NullIsRead)
{
    assay_host_options_free(nullptr);
    assay_host_stop_free(nullptr);
    assay_host_result_free(nullptr);
    EXPECT_EQ(assay_host_result_verdict(nullptr), ASSAY_HOST_NEVER_STARTED);
    EXPECT_EQ(assay_host_result_usable(nullptr, ASSAY_HOST_OPENGL), ASSAY_HOST_UNKNOWN);
    EXPECT_STREQ(assay_host_result_reason(nullptr), "");
    EXPECT_EQ(assay_host_result_find(nullptr, "x"), nullptr);
    EXPECT_EQ(assay_host_answer_kind(nullptr), ASSAY_HOST_NOTHING);
    EXPECT_STREQ(assay_host_answer_reason(nullptr), "no such key");
    EXPECT_EQ(assay_host_device_software(nullptr), -1);
    EXPECT_EQ(assay_host_result_document(nullptr, nullptr), nullptr);
}

} // namespace
