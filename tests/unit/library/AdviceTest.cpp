// What an advice brings, and what it remembers.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include <atomic>
#include <future>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "Advices.h"

namespace {

using testing::HasSubstr;
using testing::StartsWith;

constexpr double kInfinite = std::numeric_limits<double>::infinity();
constexpr double kNoNumber = std::numeric_limits<double>::quiet_NaN();
constexpr double kDay = 24 * 3600;

TEST(LibraryAdvice, ComesFromOneAttemptAndThenFromMemory)
{
    const StateFolder folder;
    const ChildAdvice first(folder);
    ASSERT_EQ(first.fError, ASSAY_HOST_OK);
    EXPECT_EQ(first.Show(), "hardware attempt tried");
    EXPECT_EQ(first.Show(ASSAY_HOST_OPENCL), "absent attempt tried");
    EXPECT_EQ(assay_host_advice_plan(first.fAdvice), ASSAY_HOST_TRY);
    EXPECT_STREQ(assay_host_advice_due(first.fAdvice), "first");
    const ChildAdvice second(folder, kCrashes);
    EXPECT_EQ(second.Show(), "hardware memory");
    EXPECT_EQ(assay_host_advice_plan(second.fAdvice), ASSAY_HOST_ANSWER);
    EXPECT_STREQ(assay_host_advice_due(second.fAdvice), "not-due");
    EXPECT_EQ(assay_host_advice_attempts(second.fAdvice), 1U);
    EXPECT_STREQ(assay_host_advice_identity(second.fAdvice),
                 assay_host_advice_identity(first.fAdvice));
    EXPECT_STRNE(assay_host_advice_identity(second.fAdvice), "");
    EXPECT_EQ(assay_host_advice_message_count(second.fAdvice), 0U);
    EXPECT_EQ(assay_host_advice_stopped(second.fAdvice), 0);
}

TEST(LibraryAdvice, DescribesHardware)
{
    const StateFolder folder;
    const ChildAdvice made(folder);
    const auto* const advice = made.fAdvice;
    EXPECT_STREQ(assay_host_advice_reason(advice, ASSAY_HOST_OPENGL), "trials-passed");
    EXPECT_THAT(assay_host_advice_text(advice, ASSAY_HOST_OPENGL), HasSubstr("OpenGL"));
    EXPECT_EQ(assay_host_advice_learnt(advice, ASSAY_HOST_OPENGL), ASSAY_HOST_HARDWARE);
    EXPECT_STREQ(assay_host_advice_device(advice, ASSAY_HOST_OPENGL), "glgpu[0]");
    std::size_t size = 0;
    EXPECT_STREQ(assay_host_advice_device_name(advice, ASSAY_HOST_OPENGL, &size), "A card");
    EXPECT_EQ(size, 6U);
    EXPECT_STREQ(assay_host_advice_device_driver(advice, ASSAY_HOST_OPENGL, &size), "1.2");
    EXPECT_EQ(size, 3U);
    EXPECT_STREQ(assay_host_advice_end(advice, ASSAY_HOST_OPENGL), "ended");
    EXPECT_STREQ(assay_host_advice_last_line(advice, ASSAY_HOST_OPENGL, &size), "");
    double seconds = -1;
    EXPECT_EQ(assay_host_advice_age(advice, ASSAY_HOST_OPENGL, &seconds), 1);
    EXPECT_GE(seconds, 0);
    EXPECT_EQ(assay_host_advice_age(advice, ASSAY_HOST_OPENGL, nullptr), 1);
    EXPECT_EQ(assay_host_advice_failures(advice, ASSAY_HOST_OPENGL), 0U);
    EXPECT_EQ(assay_host_advice_next_attempt(advice, ASSAY_HOST_OPENGL, &seconds), 1);
    EXPECT_GT(seconds, 29 * kDay);
    EXPECT_THAT(assay_host_advice_change(advice, ASSAY_HOST_OPENGL),
                StartsWith("The next attempt is due at "));
    EXPECT_STREQ(assay_host_advice_warning(advice, ASSAY_HOST_OPENGL), "");
}

TEST(LibraryAdvice, DescribesACrashAndRemembersIt)
{
    const StateFolder folder;
    const Options options;
    assay_host_options_set_policy(options, ASSAY_HOST_PAUSE, kDay);
    const ChildAdvice made(folder, kCrashes, options);
    EXPECT_EQ(made.Show(), "broken attempt tried");
    const ChildAdvice again(folder, kWorks, options);
    EXPECT_EQ(again.Show(), "broken memory");
    const auto* const advice = again.fAdvice;
    EXPECT_STREQ(assay_host_advice_reason(advice, ASSAY_HOST_OPENGL), "crashed");
    EXPECT_STREQ(assay_host_advice_end(advice, ASSAY_HOST_OPENGL), "crashed");
    EXPECT_STRNE(assay_host_advice_end_text(advice, ASSAY_HOST_OPENGL), "");
    std::size_t size = 0;
    EXPECT_STREQ(assay_host_advice_last_line(advice, ASSAY_HOST_OPENGL, &size), "# a call");
    EXPECT_EQ(size, 8U);
    EXPECT_EQ(assay_host_advice_failures(advice, ASSAY_HOST_OPENGL), 1U);
    double seconds = 0;
    EXPECT_EQ(assay_host_advice_next_attempt(advice, ASSAY_HOST_OPENGL, &seconds), 1);
    EXPECT_GT(seconds, 0);
    EXPECT_LE(seconds, kDay);
}

TEST(LibraryAdvice, TriesAgainByItsOptions)
{
    const StateFolder folder;
    const Options options;
    assay_host_options_set_policy(options, ASSAY_HOST_PAUSE, 0);
    assay_host_options_set_policy(options, ASSAY_HOST_RETRIES, 1);
    EXPECT_EQ(ChildAdvice(folder, kCrashes, options).Show(), "broken attempt tried");
    EXPECT_EQ(ChildAdvice(folder, {}, options).Show(), "broken attempt tried");
    EXPECT_EQ(ChildAdvice(folder, {}, options).Show(), "broken memory") << "one retry";
    const Options other;
    assay_host_options_set_policy(other, ASSAY_HOST_PAUSE, 0);
    const ChildAdvice good(folder, kWorks, other);
    EXPECT_EQ(good.Show(), "hardware attempt tried");
    EXPECT_STRNE(assay_host_advice_warning(good.fAdvice, ASSAY_HOST_OPENGL), "");
    const Options fresh;
    assay_host_options_set_fresh(fresh, 1);
    const ChildAdvice asked(folder, kWorks, fresh);
    EXPECT_EQ(asked.Show(), "hardware attempt tried");
    EXPECT_STREQ(assay_host_advice_due(asked.fAdvice), "requested");
    EXPECT_EQ(assay_host_advice_attempts(asked.fAdvice), 4U);
}

TEST(LibraryAdvice, AttemptsAreForTheNeededInterface)
{
    const StateFolder folder;
    const Words crashInOpenCL = {"out", "assayStart=\"x\"",  "out",  "NumGLGPUs=0",
                                 "out", "OpenCLAvailable=1", "abort"};
    const Options options;
    assay_host_options_set_policy(options, ASSAY_HOST_PAUSE, 0);
    EXPECT_EQ(ChildAdvice(folder, crashInOpenCL, options).Show(ASSAY_HOST_OPENCL),
              "broken attempt tried");
    EXPECT_EQ(ChildAdvice(folder, {}, options).Show(ASSAY_HOST_OPENCL), "broken memory");
    assay_host_options_set_need(options, 0, 1);
    const ChildAdvice made(folder, {}, options);
    EXPECT_EQ(made.Show(ASSAY_HOST_OPENCL), "broken attempt tried");
    const auto json = nlohmann::json::parse(assay_host_advice_document(made.fAdvice, nullptr));
    EXPECT_EQ(json["status"], 21) << "broken";
}

TEST(LibraryAdvice, ADryRunChangesNothing)
{
    const StateFolder folder;
    const Options options;
    assay_host_options_set_dry_run(options, 1);
    const ChildAdvice made(folder, kWorks, options);
    EXPECT_EQ(made.Show(), "unknown none");
    EXPECT_EQ(assay_host_advice_plan(made.fAdvice), ASSAY_HOST_TRY);
    EXPECT_STREQ(assay_host_advice_due(made.fAdvice), "first");
    double seconds = 5;
    EXPECT_EQ(assay_host_advice_age(made.fAdvice, ASSAY_HOST_OPENGL, &seconds), 0);
    EXPECT_EQ(assay_host_advice_next_attempt(made.fAdvice, ASSAY_HOST_OPENGL, &seconds), 0);
    EXPECT_EQ(seconds, 5);
    EXPECT_FALSE(folder.Exists());
}

TEST(LibraryAdvice, HasADocument)
{
    const StateFolder folder;
    const ChildAdvice made(folder);
    std::size_t size = 0;
    const char* const text = assay_host_advice_document(made.fAdvice, &size);
    const auto json = nlohmann::json::parse(text, text + size);
    EXPECT_EQ(json["schema"], 1);
    EXPECT_EQ(json["version"], ASSAY_VERSION);
    EXPECT_EQ(json["status"], 0);
    EXPECT_EQ(json["tried"], true);
    EXPECT_EQ(json["identity"], assay_host_advice_identity(made.fAdvice));
    EXPECT_EQ(json["opengl"]["answer"], "hardware");
    EXPECT_EQ(json["opengl"]["text"], assay_host_advice_text(made.fAdvice, ASSAY_HOST_OPENGL));
}

TEST(LibraryAdvice, AFolderThatCannotBeUsedCostsAnAttemptEachTime)
{
    const StateFolder folder;
    const std::string below = std::string(folder.Get()) + "/none";
    for (int call = 0; call < 2; ++call) {
        const ChildAdvice made(below.c_str());
        ASSERT_EQ(made.fError, ASSAY_HOST_OK);
        EXPECT_EQ(made.Show(), "hardware attempt tried");
        ASSERT_EQ(assay_host_advice_message_count(made.fAdvice), 1U);
        EXPECT_THAT(assay_host_advice_message(made.fAdvice, 0),
                    StartsWith("The state can't be kept: "));
        EXPECT_STREQ(assay_host_advice_message(made.fAdvice, 1), "");
    }
}

TEST(LibraryAdvice, AChildThatCannotBeStartedBlamesNobody)
{
    const StateFolder folder;
    const Options options;
    assay_host_options_set_program(options, "no-such-program");
    for (int call = 0; call < 2; ++call) {
        const ChildAdvice made(folder, {}, options);
        EXPECT_EQ(made.Show(), "unknown attempt tried");
        EXPECT_STREQ(assay_host_advice_reason(made.fAdvice, ASSAY_HOST_OPENGL), "never-started");
        EXPECT_STREQ(assay_host_advice_end(made.fAdvice, ASSAY_HOST_OPENGL), "not-started");
    }
}

TEST(LibraryAdvice, AStopBlamesNobody)
{
    const StateFolder folder;
    assay_host_stop* const stop = assay_host_stop_new();
    Options options;
    options.OnLine([&](const std::string&) {
        assay_host_stop_raise(stop);
        return 0;
    });
    const ChildAdvice made(folder, {"out", "x", "sleep", "600000"}, options, stop);
    EXPECT_EQ(made.fError, ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_advice_stopped(made.fAdvice), 1);
    EXPECT_STREQ(assay_host_advice_end(made.fAdvice, ASSAY_HOST_OPENGL), "host-stopped");
    EXPECT_EQ(made.Show(), "unknown attempt tried");
    const ChildAdvice later(folder, kWorks, {}, stop);
    EXPECT_EQ(assay_host_advice_stopped(later.fAdvice), 1) << "the stop holds";
    const ChildAdvice again(folder);
    EXPECT_EQ(again.Show(), "hardware attempt tried");
    EXPECT_STREQ(assay_host_advice_warning(again.fAdvice, ASSAY_HOST_OPENGL), "");
    assay_host_stop_free(stop);
}

TEST(LibraryAdvice, NullOptionsAreTheDefaults)
{
    const StateFolder folder;
    assay_host_stop* const stop = assay_host_stop_new();
    assay_host_stop_raise(stop);
    assay_host_advice* advice = nullptr;
    ASSERT_EQ(assay_host_advise(nullptr, folder.Get(), stop, &advice), ASSAY_HOST_OK);
    ASSERT_NE(advice, nullptr);
    EXPECT_STRNE(assay_host_advice_identity(advice), "");
    assay_host_advice_free(advice);
    assay_host_stop_free(stop);
}

TEST(LibraryAdvice, ACallbackEndsTheAttempt)
{
    const StateFolder folder;
    Options options;
    options.OnErrorLine([](const std::string&) { return 1; });
    const ChildAdvice made(folder, {"err", "x", "sleep", "600000"}, options);
    EXPECT_EQ(assay_host_advice_stopped(made.fAdvice), 1);
}

TEST(LibraryAdvice, CallsDuringAnAttemptWaitOrDont)
{
    const StateFolder folder;
    assay_host_stop* const stop = assay_host_stop_new();
    assay_host_stop_raise(stop);
    bool isCalled = false;
    Options options;
    // This callback holds the attempt open.
    options.OnLine([&](const std::string&) {
        if (std::exchange(isCalled, true))
            return 0;
        const Options atOnce;
        assay_host_options_set_wait(atOnce, 0);
        const ChildAdvice unknown(folder, {}, atOnce);
        EXPECT_EQ(unknown.Show(), "unknown none");
        EXPECT_EQ(assay_host_advice_plan(unknown.fAdvice), ASSAY_HOST_WAIT);
        EXPECT_STREQ(assay_host_advice_reason(unknown.fAdvice, ASSAY_HOST_OPENGL),
                     "other-instance");
        EXPECT_EQ(assay_host_advice_stopped(unknown.fAdvice), 0);
        const Options patient;
        assay_host_options_set_wait(patient, 1e9);
        const ChildAdvice stopped(folder, {}, patient, stop);
        EXPECT_EQ(assay_host_advice_stopped(stopped.fAdvice), 1);
        EXPECT_EQ(assay_host_advice_tried(stopped.fAdvice), 0);
        return 0;
    });
    EXPECT_EQ(ChildAdvice(folder, kWorks, options).Show(), "hardware attempt tried");
    EXPECT_TRUE(isCalled);
    assay_host_stop_free(stop);
}

TEST(LibraryAdvice, ThreadsShareOneChild)
{
    constexpr int kThreads = 16;
    const StateFolder folder;
    std::atomic<int> starts{0};
    std::atomic<int> tried{0};
    std::atomic<int> good{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < kThreads; ++thread)
        threads.emplace_back([&] {
            Options options;
            assay_host_options_set_wait(options, 1e9);
            options.OnLine([&](const std::string& line) {
                starts += line == "assayStart=\"x\"";
                return 0;
            });
            const ChildAdvice made(folder, kWorks, options);
            tried += assay_host_advice_tried(made.fAdvice);
            good +=
                assay_host_advice_usable(made.fAdvice, ASSAY_HOST_OPENGL) == ASSAY_HOST_HARDWARE &&
                assay_host_advice_message_count(made.fAdvice) == 0;
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(starts, 1);
    EXPECT_EQ(tried, 1);
    EXPECT_EQ(good, kThreads);
}

TEST(LibraryAdvice, LeavesNothing)
{
    const StateFolder folder;
    const Options options;
    assay_host_options_set_fresh(options, 1);
    const auto call = [&] { EXPECT_EQ(ChildAdvice(folder, {}, options).fError, ASSAY_HOST_OK); };
    for (const std::string& word : kWorks)
        assay_host_options_add_argument(options, word.c_str());
    call();
    const Counts before = CountThings();
    constexpr int kCalls = 5;
    for (int count = 0; count < kCalls; ++count)
        call();
    EXPECT_EQ(CountAfter(kCalls, before), before);
}

TEST(LibraryAdvice, ArgumentsOutOfRange)
{
    const StateFolder folder;
    const Options options;
    EXPECT_EQ(assay_host_advise(options, folder.Get(), nullptr, nullptr), ASSAY_HOST_NULL_POINTER);
    // What was there before a failure could be freed twice.
    const ChildAdvice before(folder);
    assay_host_advice* advice = before.fAdvice;
    EXPECT_EQ(assay_host_advise(options, nullptr, nullptr, &advice), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(advice, nullptr);
    advice = before.fAdvice;
    EXPECT_EQ(assay_host_advise(options, "", nullptr, &advice), ASSAY_HOST_BAD_TEXT);
    EXPECT_EQ(advice, nullptr);
    assay_host_advice_free(nullptr);
    EXPECT_EQ(assay_host_options_set_wait(nullptr, 1), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_set_wait(options, 1e300), ASSAY_HOST_OK);
    for (const double bad : {-1.0, kInfinite, kNoNumber})
        EXPECT_EQ(assay_host_options_set_wait(options, bad), ASSAY_HOST_BAD_VALUE);
    for (const auto set : {assay_host_options_set_fresh, assay_host_options_set_dry_run}) {
        EXPECT_EQ(set(nullptr, 1), ASSAY_HOST_NULL_POINTER);
        EXPECT_EQ(set(options, 1), ASSAY_HOST_OK);
    }
    EXPECT_EQ(assay_host_options_set_need(nullptr, 1, 1), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_set_need(options, 0, 0), ASSAY_HOST_BAD_VALUE);
    EXPECT_EQ(assay_host_options_set_need(options, 1, 1), ASSAY_HOST_OK);
}

TEST(LibraryAdvice, PoliciesOutOfRange)
{
    const Options options;
    const auto set = [&](assay_host_policy which, double value) {
        return assay_host_options_set_policy(options, which, value);
    };
    EXPECT_EQ(assay_host_options_set_policy(nullptr, ASSAY_HOST_PAUSE, 1), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(set(MakeNumber<assay_host_policy>(10), 1), ASSAY_HOST_BAD_VALUE);
    for (const assay_host_policy time :
         {ASSAY_HOST_MAX_AGE, ASSAY_HOST_KEEP_ABSENT, ASSAY_HOST_KEEP_UNKNOWN, ASSAY_HOST_PAUSE,
          ASSAY_HOST_FORGIVE, ASSAY_HOST_FORGIVE_FREEZE, ASSAY_HOST_UNCLEAR_PAUSE}) {
        for (const double bad : {-1.0, kInfinite, kNoNumber})
            EXPECT_EQ(set(time, bad), ASSAY_HOST_BAD_VALUE) << time;
        for (const double good : {0.0, 0.5, 1e300})
            EXPECT_EQ(set(time, good), ASSAY_HOST_OK) << time;
    }
    for (const assay_host_policy count :
         {ASSAY_HOST_RETRIES, ASSAY_HOST_PAUSE_GROWTH, ASSAY_HOST_UNCLEAR}) {
        for (const double bad : {-1.0, 1.5, 1001.0, kInfinite, kNoNumber})
            EXPECT_EQ(set(count, bad), ASSAY_HOST_BAD_VALUE) << count;
        for (const double good : {1.0, 1000.0})
            EXPECT_EQ(set(count, good), ASSAY_HOST_OK) << count;
        EXPECT_EQ(set(count, 0), count == ASSAY_HOST_RETRIES ? ASSAY_HOST_OK : ASSAY_HOST_BAD_VALUE)
            << count;
    }
}

} // namespace
