#include "fleet/PrometheusText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"

namespace assay_host {
namespace {

using testing::AllOf;
using testing::Contains;
using testing::Each;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

RunFacts MakeFacts()
{
    RunFacts facts;
    facts.fHostVersion = "1.2.3";
    facts.fChildVersion = {"1.2.4", ""};
    facts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    return facts;
}

std::string GetText(const std::string& report, Verdict verdict = Verdict::kComplete,
                    const RunFacts& facts = MakeFacts())
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fSeconds = 0.25;
    std::ostringstream out;
    WritePrometheusText(out, ReadReport(report), outcome, facts);
    return out.str();
}

std::vector<std::string> Split(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);)
        lines.push_back(line);
    return lines;
}

std::vector<std::string> GetSeries(const std::string& text)
{
    std::vector<std::string> series;
    for (const std::string& line : Split(text))
        if (line.front() != '#')
            series.push_back(line);
    return series;
}

TEST(PrometheusText, IsTheWholeOfAMachineWithOneCard)
{
    EXPECT_THAT(
        GetSeries(GetText(Sample(1, 1).GetText())),
        testing::ElementsAre(
            R"(assay_build_info{version="1.2.3",assay_version="1.2.4"} 1)",
            "assay_last_run_timestamp_seconds 1795310762", "assay_last_run_duration_seconds 0.25",
            R"(assay_run_verdict{verdict="complete"} 1)",
            R"(assay_run_verdict{verdict="failed-tests"} 0)",
            R"(assay_run_verdict{verdict="usage-error"} 0)",
            R"(assay_run_verdict{verdict="crashed"} 0)", R"(assay_run_verdict{verdict="hung"} 0)",
            R"(assay_run_verdict{verdict="never-started"} 0)",
            R"(assay_run_verdict{verdict="interrupted"} 0)",
            R"(assay_usable{api="opengl",answer="hardware"} 1)",
            R"(assay_usable{api="opengl",answer="software"} 0)",
            R"(assay_usable{api="opengl",answer="broken"} 0)",
            R"(assay_usable{api="opengl",answer="absent"} 0)",
            R"(assay_usable{api="opengl",answer="unknown"} 0)",
            R"(assay_usable{api="opencl",answer="hardware"} 1)",
            R"(assay_usable{api="opencl",answer="software"} 0)",
            R"(assay_usable{api="opencl",answer="broken"} 0)",
            R"(assay_usable{api="opencl",answer="absent"} 0)",
            R"(assay_usable{api="opencl",answer="unknown"} 0)", "assay_warnings 0",
            R"(assay_devices{api="opengl"} 1)", R"(assay_devices{api="opencl"} 1)",
            R"(assay_device_info{api="opengl",device="glgpu[0]",name="Accelerator 4000",)"
            R"(vendor="Example Corporation",version="4.1",driver="C:\\drivers\\example64.dll",)"
            R"(driver_version="31.0.15.2802"} 1)",
            R"(assay_device_info{api="opencl",device="clgpu[0]",name="Accelerator 4000",)"
            R"(vendor="Example Corporation",version="3.0 CUDA",driver_version="528.02"} 1)",
            R"(assay_device_failed{api="opengl",device="glgpu[0]"} 0)",
            R"(assay_device_failed{api="opencl",device="clgpu[0]"} 0)",
            R"(assay_device_software{api="opengl",device="glgpu[0]"} 0)",
            R"(assay_device_software{api="opencl",device="clgpu[0]"} 0)",
            R"(assay_device_integrated{api="opengl",device="glgpu[0]"} 0)",
            R"(assay_device_integrated{api="opencl",device="clgpu[0]"} 0)",
            R"(assay_device_shaders_compile{api="opengl",device="glgpu[0]"} 1)",
            R"(assay_device_framebuffers_work{api="opengl",device="glgpu[0]"} 1)",
            R"(assay_memory_bytes{api="opengl",device="glgpu[0]"} 25757220864)",
            R"(assay_memory_bytes{api="opencl",device="clgpu[0]"} 25757220864)",
            R"(assay_copy_bytes_per_second{api="opencl",device="clgpu[0]"} 834512000000)",
            R"(assay_compute_score{api="opencl",device="clgpu[0]"} 1234.56)"));
}

// Each series follows the two lines of its metric, each metric comes once, and no line has a
// timestamp.
TEST(PrometheusText, HasHelpAndTypeOfEachMetric)
{
    std::set<std::string> seen;
    std::string name;
    std::string help;
    for (const std::string& line : Split(GetText(Sample(2, 1).GetText()))) {
        if (line.front() != '#') {
            const std::string rest = line.substr(std::min(line.find_first_of("{ "), line.size()));
            EXPECT_EQ(line.substr(0, line.find_first_of("{ ")), name);
            const std::string value =
                rest.substr(rest.find("} ") == std::string::npos ? 1 : rest.find("} ") + 2);
            EXPECT_THAT(value, AllOf(Not(IsEmpty()), Not(HasSubstr(" ")))) << line;
        } else if (line.rfind("# HELP ", 0) == 0) {
            name = line.substr(7, line.find(' ', 7) - 7);
            help = name;
            EXPECT_TRUE(seen.insert(name).second) << line;
        } else {
            EXPECT_EQ(line, "# TYPE " + help + " gauge");
            help.clear();
        }
    }
    EXPECT_EQ(seen.size(), 16U);
}

TEST(PrometheusText, SaysWhatEachMetricIs)
{
    std::vector<std::string> help;
    for (const std::string& line : Split(GetText(Sample(1, 1).GetText())))
        if (line.rfind("# HELP assay_", 0) == 0)
            help.push_back(line.substr(13));
    EXPECT_THAT(
        help,
        testing::ElementsAre(
            "build_info Versions of the programs; always 1.",
            "last_run_timestamp_seconds Start of the last run, since 1970 in UTC.",
            "last_run_duration_seconds Time from the child's launch to its end.",
            "run_verdict How the last run ended: 1 for its verdict, 0 for the others.",
            "usable Whether the interface can be used: 1 for the answer, 0 for the others.",
            "warnings Number of warnings of the last run.",
            "devices Number of devices of the interface.",
            "device_info Texts that describe a device; always 1.",
            "device_failed Whether a test of the device failed.",
            "device_software Whether the device is a software renderer.",
            "device_integrated Whether the device is part of the processor.",
            "device_shaders_compile Whether a realistic pair of shaders compiles and links.",
            "device_framebuffers_work Whether a framebuffer object can be created and drawn to.",
            "memory_bytes Memory of the device.",
            "copy_bytes_per_second Measured speed of copies within the device.",
            "compute_score Measured speed of computation; more is faster."));
}

TEST(PrometheusText, LeavesOutWhatIsNotKnown)
{
    const std::string text = GetText(Sample(1, 1)
                                         .Set("glgpu[0].GLMemoryMB", "0")
                                         .Set("glgpu[0].GLDriver", "\"?\"")
                                         .Set("glgpu[0].GLVendor", "\"\"")
                                         .Set("clgpu[0].CLBandwidth", "0")
                                         .Set("clgpu[0].CLCompute", "1e9")
                                         .GetText());
    EXPECT_THAT(text, Not(HasSubstr(R"(assay_memory_bytes{api="opengl")")));
    EXPECT_THAT(text, HasSubstr(R"(assay_memory_bytes{api="opencl")"));
    EXPECT_THAT(text, Not(HasSubstr("driver=")));
    EXPECT_THAT(text, Not(HasSubstr("copy_bytes_per_second")));
    EXPECT_THAT(text, Not(HasSubstr("compute_score")));
    EXPECT_THAT(text, HasSubstr(R"(device="glgpu[0]",name="Accelerator 4000",version="4.1")"));
}

TEST(PrometheusText, LeavesOutWhatTheRunDidNotReach)
{
    const std::string text =
        GetText(Sample(1, 1).EndAfter("OGLContextCreated").GetText(), Verdict::kCrashed);
    EXPECT_THAT(GetSeries(text),
                AllOf(Contains(R"(assay_run_verdict{verdict="crashed"} 1)"),
                      Contains(R"(assay_usable{api="opengl",answer="broken"} 1)"),
                      Contains(R"(assay_usable{api="opencl",answer="unknown"} 1)")));
    EXPECT_THAT(text, Not(HasSubstr("assay_devices")));
    RunFacts facts;
    facts.fChildVersion = {"", "its file has none"};
    const std::string nothing = GetText("", Verdict::kNeverStarted, facts);
    EXPECT_THAT(nothing, Not(HasSubstr("timestamp")));
    EXPECT_THAT(nothing, Not(HasSubstr("assay_version")));
}

// A report as assay prints it has neither times nor versions.
TEST(PrometheusText, LeavesOutWhatAFileDoesNotHave)
{
    RunFacts facts;
    facts.fChildVersion = {"", "it was not stored"};
    std::ostringstream out;
    WritePrometheusText(out, ReadReport(Sample(1, 1).GetText()), RunOutcome(), facts);
    EXPECT_THAT(out.str(), AllOf(Not(HasSubstr("build_info")), Not(HasSubstr("timestamp")),
                                 Not(HasSubstr("duration"))));
    facts.fChildVersion = {"1.2.4", ""};
    EXPECT_THAT(GetText("", Verdict::kComplete, facts),
                HasSubstr("\nassay_build_info{assay_version=\"1.2.4\"} 1\n"));
}

TEST(PrometheusText, CountsNoDeviceWithoutOpenCL)
{
    EXPECT_THAT(GetSeries(GetText(Sample(1, -1).GetText())),
                AllOf(Contains(R"(assay_devices{api="opencl"} 0)"),
                      Contains(R"(assay_usable{api="opencl",answer="absent"} 1)")));
}

TEST(PrometheusText, EscapesAnyTextOfADriver)
{
    const auto getInfo = [](const std::string& name) {
        const std::string text =
            GetText(Sample(1, -1).Set("glgpu[0].GLName", "\"" + name + "\"").GetText());
        for (const std::string& line : GetSeries(text))
            if (line.rfind("assay_device_info", 0) == 0)
                return line;
        return text;
    };
    EXPECT_THAT(getInfo(R"(a"b\c)"), HasSubstr(R"(name="a\"b\\c",)"));
    EXPECT_THAT(getInfo("\xFF\x1B\n\xE2\x80\xAE"), HasSubstr(R"(name="\\xFF\\x1B\\n\\u{202E}",)"));
    EXPECT_THAT(getInfo("\xC3\xA9"), HasSubstr("name=\"\xC3\xA9\","));
    // Whole characters up to the limit.
    const auto repeat = [](const std::string& text, int count) {
        std::string all;
        for (int each = 0; each < count; ++each)
            all += text;
        return all;
    };
    EXPECT_THAT(getInfo(std::string(60000, 'x')),
                HasSubstr("name=\"" + std::string(200, 'x') + "\","));
    EXPECT_THAT(getInfo("x" + repeat("\xC3\xA9", 300)),
                HasSubstr("name=\"x" + repeat("\xC3\xA9", 99) + "\","));
    EXPECT_THAT(getInfo("x" + repeat("\\", 300)),
                HasSubstr("name=\"x" + repeat(R"(\\)", 199) + "\","));
}

// docs/fleet.md has these numbers.
TEST(PrometheusText, HasFewSeries)
{
    EXPECT_EQ(GetSeries(GetText(Sample(1, 1).GetText())).size(), 37U);
    EXPECT_EQ(GetSeries(GetText(Sample(8, 8).GetText())).size(), 135U);
    EXPECT_EQ(GetSeries(GetText("")).size(), 21U);
}

} // namespace
} // namespace assay_host
