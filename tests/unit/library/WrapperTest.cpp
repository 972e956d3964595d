// The C++ wrapper.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <variant>
#include <vector>

#include <assay_host.hpp>

#include "Advices.h"
#include "TestChild.h"

namespace {

using testing::ElementsAre;

assay::Options MakeOptions(std::vector<std::string> arguments)
{
    assay::Options options;
    options.program = TEST_CHILD;
    options.arguments = std::move(arguments);
    options.timeout_seconds = 300;
    return options;
}

TEST(Wrapper, BringsTheResultAsValues)
{
    const assay::Result result = run(MakeOptions(
        {"out", "assayStart=\"x\"", "out", "NumGLGPUs=1", "out", "glgpu[0].GLRenderer=\"softpipe\"",
         "out", "glgpu[0].GLMemoryMB=16", "err", "words", "exit", "4"}));
    EXPECT_EQ(result.verdict(), assay::Verdict::failed_tests);
    EXPECT_EQ(to_string(result.verdict()), "failed-tests");
    EXPECT_EQ(result.exit_status(), 4);
    EXPECT_THAT(result.error_lines(), ElementsAre("words"));
    EXPECT_EQ(result.usable(assay::Interface::opengl).usability, assay::Usability::broken);
    EXPECT_EQ(result.usable(assay::Interface::opengl).reason, "ended");
    ASSERT_EQ(result.devices().size(), 1U);
    EXPECT_EQ(result.devices()[0].tag, "glgpu[0]");
    EXPECT_EQ(result.devices()[0].software, true);
    EXPECT_FALSE(result.warnings().empty());
    EXPECT_EQ(std::get<double>(result.find("glgpu[0].GLMemoryMB").value), 16);
    EXPECT_EQ(std::get<std::string>(result.find("glgpu[0].GLRenderer").value), "softpipe");
    const assay::Answer none = result.find("nonsense");
    EXPECT_FALSE(none);
    EXPECT_EQ(none.reason, "no such key");
    EXPECT_EQ(result.answers().size(), assay_host_result_answer_count(result.get()));
    EXPECT_EQ(result.document().front(), '{');
}

TEST(Wrapper, HasTheLastLinesAndWhatTheLimitsDropped)
{
    using namespace std::string_literals;
    // Lines "x=<zero byte>" and "# <zero byte>y".
    const assay::Result result =
        run(MakeOptions({"raw", "783d000a232000790a", "flood-errors", "70000"}));
    EXPECT_EQ(result.last_line(), "x=\0"s);
    EXPECT_EQ(result.last_log_line(), "# \0y"s);
    EXPECT_EQ(result.lost_bytes(), 0U);
    EXPECT_EQ(result.lost_error_bytes(), 70000U - 65536U);
    assay::Options short_lines = MakeOptions({"out", "x=12345"});
    short_lines.max_line_bytes = 4;
    const assay::Result cut = run(short_lines);
    EXPECT_EQ(cut.last_line(), "x=12");
    EXPECT_EQ(cut.last_log_line(), "");
    EXPECT_EQ(cut.lost_bytes(), 3U);
    EXPECT_EQ(cut.lost_error_bytes(), 0U);
}

TEST(Wrapper, HasTheVersion)
{
    EXPECT_EQ(assay::version(), assay_host_version());
}

TEST(Wrapper, AnExceptionOfACallbackEndsTheRunAndArrives)
{
    assay::Options options = MakeOptions({"out", "x", "sleep", "600000"});
    options.on_line = [](std::string_view line, double) -> bool {
        throw std::runtime_error("of " + std::string(line));
    };
    try {
        run(options);
        FAIL() << "no exception";
    } catch (const std::runtime_error& failure) {
        EXPECT_STREQ(failure.what(), "of x");
    }
}

TEST(Wrapper, AFalseCallbackAndAStopEndTheRun)
{
    assay::Options options = MakeOptions({"err", "x", "sleep", "600000"});
    options.on_error_line = [](std::string_view, double) { return false; };
    EXPECT_EQ(run(options).verdict(), assay::Verdict::interrupted);
    assay::Stop stop;
    options.on_error_line = nullptr;
    options.on_tick = [&](double, std::uint64_t, std::string_view) {
        stop.raise();
        return true;
    };
    EXPECT_EQ(run(options, &stop).verdict(), assay::Verdict::interrupted);
}

TEST(Wrapper, ABadOptionThrows)
{
    assay::Options options = MakeOptions({});
    options.timeout_seconds = -1;
    EXPECT_THROW(run(options), std::invalid_argument);
    options.timeout_seconds = 1;
    options.need_opengl = false;
    EXPECT_THROW(assay::advise("x", options), std::invalid_argument);
    EXPECT_THROW(assay::advise(""), std::invalid_argument);
    EXPECT_THROW(assay::State(""), std::invalid_argument);
}

TEST(Wrapper, AnAdviceAsValues)
{
    const StateFolder folder;
    const assay::Advice first = assay::advise(folder.Get(), MakeOptions(kWorks));
    EXPECT_EQ(first.usability(assay::Interface::opengl), assay::Usability::hardware);
    EXPECT_EQ(first.usability(assay::Interface::opencl), assay::Usability::absent);
    EXPECT_TRUE(first.tried());
    EXPECT_FALSE(first.stopped());
    EXPECT_EQ(first.plan(), assay::Plan::attempt);
    EXPECT_EQ(to_string(first.plan()), "try");
    EXPECT_EQ(first.due(), "first");
    EXPECT_EQ(first.attempts(), 1U);
    EXPECT_THAT(first.messages(), testing::IsEmpty());
    EXPECT_EQ(first.document().front(), '{');
    EXPECT_FALSE(first.identity().empty());
    const assay::Advised gl = first.of(assay::Interface::opengl);
    EXPECT_EQ(gl.usability, assay::Usability::hardware);
    EXPECT_EQ(gl.learnt, assay::Usability::hardware);
    EXPECT_THAT(
        (std::vector<std::string>{gl.reason, gl.source, gl.device, gl.device_name, gl.device_driver,
                                  gl.end, gl.last_line, gl.warning}),
        ElementsAre("trials-passed", "attempt", "glgpu[0]", "A card", "1.2", "ended", "", ""));
    EXPECT_EQ(gl.text, assay_host_advice_text(first.get(), ASSAY_HOST_OPENGL));
    EXPECT_EQ(gl.end_text, assay_host_advice_end_text(first.get(), ASSAY_HOST_OPENGL));
    EXPECT_EQ(gl.change, assay_host_advice_change(first.get(), ASSAY_HOST_OPENGL));
    EXPECT_TRUE(gl.age_seconds);
    EXPECT_TRUE(gl.next_attempt_seconds);
    EXPECT_EQ(gl.failures, 0U);
}

TEST(Wrapper, AnAdviceByEachOption)
{
    const StateFolder folder;
    assay::Options options = MakeOptions(kCrashes);
    options.dry_run = true;
    EXPECT_EQ(assay::advise(folder.Get(), options).plan(), assay::Plan::attempt);
    EXPECT_FALSE(folder.Exists());
    options.dry_run = false;
    const assay::Advised crashed =
        assay::advise(folder.Get(), options).of(assay::Interface::opengl);
    EXPECT_EQ(crashed.usability, assay::Usability::broken);
    EXPECT_EQ(crashed.last_line, "# a call");
    EXPECT_EQ(crashed.failures, 1U);
    options.policy.pause = 0;
    options.policy.retries = 0;
    EXPECT_FALSE(assay::advise(folder.Get(), options).tried());
    options.policy.retries = 2;
    EXPECT_TRUE(assay::advise(folder.Get(), options).tried());
    assay::State(folder.Get()).forget();
    options.arguments = kWorks;
    EXPECT_TRUE(assay::advise(folder.Get(), options).tried());
    EXPECT_FALSE(assay::advise(folder.Get(), options).tried());
    options.fresh = true;
    EXPECT_EQ(assay::advise(folder.Get(), options).due(), "requested");
}

TEST(Wrapper, AnExceptionOfACallbackEndsAnAttemptAndArrives)
{
    const StateFolder folder;
    assay::Options options = MakeOptions({"out", "x", "sleep", "600000"});
    options.on_line = [](std::string_view line, double) -> bool {
        throw std::runtime_error("of " + std::string(line));
    };
    try {
        assay::advise(folder.Get(), options);
        FAIL() << "no exception";
    } catch (const std::runtime_error& failure) {
        EXPECT_STREQ(failure.what(), "of x");
    }
    const assay::Advice later = assay::advise(folder.Get(), MakeOptions(kWorks));
    EXPECT_EQ(later.of(assay::Interface::opengl).warning, "") << "nobody is blamed";
    EXPECT_TRUE(later.tried());
    assay::Stop stop;
    stop.raise();
    options = MakeOptions(kWorks);
    options.fresh = true;
    EXPECT_TRUE(assay::advise(folder.Get(), options, &stop).stopped());
}

TEST(Wrapper, AChoiceAndItsFailures)
{
    const StateFolder folder;
    assay::State state(folder.Get());
    state.set_choice(assay::Interface::opencl, assay::Choice::absent);
    EXPECT_EQ(state.choice(assay::Interface::opencl), assay::Choice::absent);
    EXPECT_EQ(state.choice(assay::Interface::opengl), assay::Choice::automatic);
    state.forget();
    EXPECT_EQ(state.choice(assay::Interface::opencl), assay::Choice::automatic);
    assay::State bad(std::string(folder.Get()) + "/none/none");
    try {
        bad.set_choice(assay::Interface::opengl, assay::Choice::hardware);
        FAIL() << "no exception";
    } catch (const std::runtime_error& failure) {
        EXPECT_THAT(failure.what(), testing::StartsWith("The state can't be changed: "));
        EXPECT_EQ(failure.what(), bad.message());
    }
}

} // namespace
