// The C++ wrapper.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <variant>
#include <vector>

#include <assay_host.hpp>

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
}

} // namespace
