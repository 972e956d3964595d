// All that a result says of two devices, one of which failed.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <tuple>
#include <vector>

#include "Runs.h"

namespace {

using testing::ElementsAre;

Words MakeWords(const std::vector<std::pair<const char*, const char*>>& lines)
{
    Words words;
    for (const auto& [channel, line] : lines)
        words = words + Words{channel, line};
    return words;
}

// The OpenGL device fails a trial and ends its tests early. The child crashes in OpenCL.
const Words kTwoDevices =
    MakeWords({
        {"out", "assayStart=\"2026-11-22_01:00:00\""},
        {"out", "QGFCoreInitialized=1"},
        {"out", "QGFOGLInitialized=1"},
        {"out", "OGLContextCreated=1"},
        {"out", "NumGLGPUs=1"},
        {"out", "gputag.glgpu[0]=1"},
        {"out", "glgpu[0].GLVersion=\"2.1\""},
        {"out", "glgpu[0].GLRenderer=\"Card\""},
        {"out", "glgpu[0].GLDriverDate=\"?\""},
        {"out", "# 00004.2026.11.22_01:00:01.000(+00.000)[tid=462f] DoCompileProgramGLSL: broken"},
        {"out", "glgpu[0].CanCompileProgramGLSL=0"},
        {"out", "glgpu[0].GLFrameBufferOK=2"},
        {"out", "OpenCLAvailable=1"},
        {"out", "NumCLGPUs=1"},
        {"out", "gputag.clgpu[0]=1"},
        {"out", "clgpu[0].CLMemoryMB=[1, 2.5]"},
        {"err", "Testing terminated for glgpu[0]: no answer"},
        {"err", "two"},
        {"out", "# last words"},
    }) +
    Words{"abort"};

TEST(LibraryAccount, OfDevices)
{
    const ChildRun run(kTwoDevices);
    std::vector<std::tuple<std::string, int, int, int, int>> devices;
    for (std::size_t at = 0; at < assay_host_result_device_count(run.fResult); ++at) {
        const assay_host_device* const device = assay_host_result_device(run.fResult, at);
        devices.emplace_back(assay_host_device_tag(device), assay_host_device_interface(device),
                             assay_host_device_complete(device), assay_host_device_failed(device),
                             assay_host_device_software(device));
    }
    EXPECT_THAT(devices, ElementsAre(std::tuple("glgpu[0]", 0, 0, 1, 0),
                                     std::tuple("clgpu[0]", 1, 0, 0, -1)));
}

TEST(LibraryAccount, OfADeviceWithItsLastLine)
{
    const ChildRun run(MakeWords({{"out", "NumGLGPUs=0"},
                                  {"out", "OpenCLAvailable=1"},
                                  {"out", "NumCLGPUs=1"},
                                  {"out", "clgpu[0].CLName=\"Card\""},
                                  {"out", "clgpu[0].CLCompute=1"}}));
    const assay_host_device* const device = assay_host_result_device(run.fResult, 0);
    EXPECT_EQ(assay_host_device_complete(device), 1);
    EXPECT_EQ(assay_host_device_failed(device), 0);
    EXPECT_EQ(assay_host_device_software(device), 0);
}

TEST(LibraryAccount, OfTheEnd)
{
    const ChildRun run(kTwoDevices);
    EXPECT_EQ(assay_host_result_verdict(run.fResult), ASSAY_HOST_CRASHED);
    EXPECT_STRNE(assay_host_result_reason(run.fResult), "");
    std::size_t size = 0;
    EXPECT_STREQ(assay_host_result_last_line(run.fResult, &size), "clgpu[0].CLMemoryMB=[1, 2.5]");
    EXPECT_EQ(size, 28U);
    ASSERT_EQ(assay_host_result_error_line_count(run.fResult), 2U);
    EXPECT_STREQ(assay_host_result_error_line(run.fResult, 0, &size),
                 "Testing terminated for glgpu[0]: no answer");
    EXPECT_EQ(size, 42U);
    EXPECT_STREQ(assay_host_result_error_line(run.fResult, 1, nullptr), "two");
    EXPECT_STREQ(assay_host_result_last_log_line(run.fResult, &size), "# last words");
    EXPECT_EQ(size, 12U);
    EXPECT_EQ(assay_host_result_lost_bytes(run.fResult), 0U);
    EXPECT_EQ(assay_host_result_lost_error_bytes(run.fResult), 0U);
}

TEST(LibraryAccount, OfWhatCanBeUsed)
{
    const ChildRun run(kTwoDevices);
    using All = std::tuple<int, std::string, std::string, std::string>;
    const auto of = [&](assay_host_interface which) {
        return All(assay_host_result_usable(run.fResult, which),
                   assay_host_result_usable_reason(run.fResult, which),
                   assay_host_result_usable_text(run.fResult, which),
                   assay_host_result_usable_device(run.fResult, which));
    };
    EXPECT_EQ(of(ASSAY_HOST_OPENGL), All(ASSAY_HOST_BROKEN, "shader-trial-failed",
                                         "OpenGL does not work: glgpu[0]: a realistic pair of "
                                         "shaders does not compile and link: "
                                         "broken.",
                                         "glgpu[0]"));
    EXPECT_EQ(of(ASSAY_HOST_OPENCL),
              All(ASSAY_HOST_BROKEN, "crashed",
                  "assay crashed in OpenCL, while reading facts of a device (clgpu[0].CLName).",
                  "clgpu[0]"));
}

TEST(LibraryAccount, OfWarnings)
{
    const ChildRun run(kTwoDevices);
    std::vector<std::vector<std::string>> warnings;
    for (std::size_t at = 0; at < assay_host_result_warning_count(run.fResult); ++at)
        warnings.push_back({assay_host_result_warning_code(run.fResult, at),
                            assay_host_result_warning_device(run.fResult, at),
                            assay_host_result_warning_text(run.fResult, at),
                            assay_host_result_warning_cause(run.fResult, at)});
    EXPECT_THAT(
        warnings,
        ElementsAre(ElementsAre("shader-trial-failed", "glgpu[0]",
                                "a realistic pair of shaders does not compile and link", "broken"),
                    ElementsAre("device-failed", "glgpu[0]",
                                "a test failed: no answer from "
                                "glGetString[GL_SHADING_LANGUAGE_VERSION] on",
                                "")));
}

TEST(LibraryAccount, OfFlagsAndLists)
{
    const ChildRun run(kTwoDevices);
    const auto find = [&](const char* key) { return assay_host_result_find(run.fResult, key); };
    EXPECT_EQ(assay_host_answer_flag(find("glgpu[0].CanCompileProgramGLSL")), 0);
    EXPECT_EQ(assay_host_answer_number(find("glgpu[0].CanCompileProgramGLSL")), 0);
    EXPECT_EQ(assay_host_answer_flag(find("QGFCoreInitialized")), 1);
    EXPECT_EQ(assay_host_answer_flag(find("glgpu[0].GLFrameBufferOK")), -1) << "neither 0 nor 1";
    EXPECT_EQ(assay_host_answer_number(find("glgpu[0].GLFrameBufferOK")), 2);
    EXPECT_EQ(assay_host_answer_flag(find("NumGLGPUs")), -1) << "1, but a count";
    const assay_host_answer* const list = find("clgpu[0].CLMemoryMB");
    EXPECT_EQ(assay_host_answer_list_size(list), 2U);
    EXPECT_EQ(assay_host_answer_list_item(list, 0), 1);
    EXPECT_EQ(assay_host_answer_list_item(list, 1), 2.5);
    EXPECT_STREQ(assay_host_answer_key(list), "clgpu[0].CLMemoryMB");
    std::size_t size = 0;
    EXPECT_STREQ(assay_host_answer_text(list, &size), "[1, 2.5]");
    EXPECT_EQ(size, 8U);
}

} // namespace
