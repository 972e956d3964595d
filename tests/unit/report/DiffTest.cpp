#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "report/CompareReports.h"
#include "report/DiffText.h"

namespace assay_host {
namespace {

std::string DiffWith(const std::string& before, const std::string& after,
                     const ComparisonOptions& options)
{
    const Report first = ReadReport(before);
    const Report second = ReadReport(after);
    const Comparison comparison = CompareReports(first, second, options);
    std::ostringstream out;
    PrintDiff(out, comparison);
    EXPECT_EQ(comparison.IsSame(), out.str().empty());
    return out.str();
}

std::string Diff(const std::string& before, const std::string& after, double tolerance = 0.1)
{
    ComparisonOptions options;
    options.fMeasurements.fTolerance = tolerance;
    return DiffWith(before, after, options);
}

std::string Diff(Sample before, Sample after, double tolerance = 0.1)
{
    return Diff(before.GetText(), after.GetText(), tolerance);
}

TEST(Diff, OfEqualReportsIsEmpty)
{
    EXPECT_EQ(Diff(Sample(2, 2), Sample(2, 2)), "");
    EXPECT_EQ(Diff("", ""), "");
}

TEST(Diff, IgnoresStampsAndLogLines)
{
    EXPECT_EQ(
        Diff(Sample(1, 1).GetText(),
             "# log\n" +
                 Sample(1, 1).Set("assayStart", "\"2027\"").Set("assayEnd", "\"2028\"").GetText()),
        "");
}

TEST(Diff, ComparesStampsIfAsked)
{
    ComparisonOptions options;
    options.fIdentity = true;
    EXPECT_EQ(DiffWith(Sample(1, 1).GetText(), Sample(1, 1).Set("assayEnd", "\"2028\"").GetText(),
                       options),
              "assayEnd: \"2026-11-21_10:49:36\" -> \"2028\"\n");
}

TEST(Diff, LetsAMeasurementBeLargerIfAsked)
{
    const auto differs = [](const char* value) {
        ComparisonOptions options;
        options.fMeasurements.fFasterIsSame = true;
        return !DiffWith(Sample(1, 1).Set("clgpu[0].CLCompute", "100").GetText(),
                         Sample(1, 1).Set("clgpu[0].CLCompute", value).GetText(), options)
                    .empty();
    };
    EXPECT_FALSE(differs("300"));
    EXPECT_FALSE(differs("91"));
    EXPECT_TRUE(differs("89"));
    EXPECT_TRUE(differs("1e9")); // implausible: not a measurement
    EXPECT_TRUE(differs("0"));
}

TEST(Diff, IgnoresLineEnds)
{
    std::string text = Sample(1, 1).GetText();
    std::string windows;
    for (const char character : text)
        windows += character == '\n' ? std::string("\r\n") : std::string(1, character);
    EXPECT_EQ(Diff(text, windows), "");
}

TEST(Diff, ReportsAChangedValue)
{
    EXPECT_EQ(Diff(Sample(2, 1), Sample(2, 1)
                                     .Set("QGFOGLInitialized", "0")
                                     .Set("glgpu[1].GLDriverVersion", "\"32.0\"")
                                     .Set("clgpu[0].CLMemoryMB", "8192")),
              "QGFOGLInitialized: 1 -> 0\n"
              "glgpu[1].GLDriverVersion: \"31.0.15.2802\" -> \"32.0\"\n"
              "clgpu[0].CLMemoryMB: 24564 -> 8192\n");
    EXPECT_EQ(Diff("a=\"1\"\n", "a=1\n"), "a: \"1\" -> 1\n");
    EXPECT_EQ(Diff("a=\"\x1B\"\n", "a=\"\xFF\n\"\n"), "a: \"\\x1B\" -> \"\\xFF\\n\"\n");
}

TEST(Diff, AppliesTheToleranceToMeasurements)
{
    const auto diff = [](const char* before, const char* after, double tolerance) {
        return Diff(Sample(0, 1).Set("clgpu[0].CLBandwidth", before),
                    Sample(0, 1).Set("clgpu[0].CLBandwidth", after), tolerance);
    };
    EXPECT_EQ(diff("1e+11", "9.1e+10", 0.1), "");
    EXPECT_EQ(diff("9.1e+10", "1e+11", 0.1), "");
    EXPECT_EQ(diff("1e+11", "8.9e+10", 0.1), "clgpu[0].CLBandwidth: 1e+11 -> 8.9e+10 (-11 %)\n");
    EXPECT_EQ(diff("8.9e+10", "1e+11", 0.1), "clgpu[0].CLBandwidth: 8.9e+10 -> 1e+11 (+12.4 %)\n");
    EXPECT_EQ(diff("1e+11", "1.01e+11", 0), "clgpu[0].CLBandwidth: 1e+11 -> 1.01e+11 (+1 %)\n");
    EXPECT_EQ(diff("1e+11", "1e+11", 0), "");
    EXPECT_EQ(diff("0", "1", 0.5), "clgpu[0].CLBandwidth: 0 -> 1\n");
    EXPECT_EQ(diff("0", "1", 1), "");
    EXPECT_EQ(diff("1e+11", "0", 0.1), "clgpu[0].CLBandwidth: 1e+11 -> 0\n");
    EXPECT_EQ(diff("inf", "1e+11", 1), "clgpu[0].CLBandwidth: inf -> 1e+11\n");
    EXPECT_EQ(diff("inf", "inf", 0), "");
    EXPECT_EQ(Diff(Sample(0, 1), Sample(0, 1).Set("clgpu[0].CLCompute", "1200")), "");
    EXPECT_EQ(Diff(Sample(0, 1), Sample(0, 1).Set("clgpu[0].CLCompute", "1000")),
              "clgpu[0].CLCompute: 1234.56 -> 1000 (-19 %)\n");
    EXPECT_EQ(Diff(Sample(1, 0), Sample(1, 0).Set("glgpu[0].GLMemoryMB", "24563"), 0.5),
              "glgpu[0].GLMemoryMB: 24564 -> 24563\n");
}

TEST(Diff, SaysWhyAMeasurementDidNotChange)
{
    const Report report = ReadReport(Sample(0, 1).GetText());
    const Answers answers = GetAnswers(report);
    const DeviceAnswers& device = answers.fDevices.at(0);
    const auto find = [](const std::vector<Answer>& all, const char* key) {
        return &*std::find_if(all.begin(), all.end(),
                              [key](const Answer& answer) { return answer.fKey == key; });
    };
    const Answer* const speed = find(device.fAnswers, "CLCompute");
    const Answer* const count = find(answers.fReport, "NumCLGPUs");
    Comparison comparison;
    comparison.fSame = {{&device, speed, speed, "a note"},
                        {nullptr, count, count, "another"},
                        {&device, speed, speed, ""}};
    std::ostringstream out;
    PrintDiff(out, comparison);
    EXPECT_EQ(out.str(), "clgpu[0].CLCompute: no change: 1234.56 and 1234.56 (a note)\n"
                         "NumCLGPUs: no change: 1 and 1 (another)\n");
}

TEST(Diff, ReportsMissingKeysAndTheirReasons)
{
    EXPECT_EQ(Diff(Sample(0, 1), Sample(0, 1).Set("clgpu[0].CUDAVersion", "")),
              "clgpu[0].CUDAVersion: \"12.0.89\" -> missing (not printed by this device)\n");
    EXPECT_EQ(Diff(Sample(0, 1).Fail("clgpu[0]", "CLCompute"), Sample(0, 1)),
              "clgpu[0].tests: failed at CLCompute -> passed "
              "(1 answer only in the second report)\n");
    EXPECT_EQ(Diff(Sample(0, 1), Sample(0, 1).EndAfter("clgpu[0].CLBandwidth")),
              "report: whole -> broken off before clgpu[0].CLCompute "
              "(1 answer only in the first report)\n");
    EXPECT_EQ(Diff(Sample(0, 0), Sample(0, -1)), "NumCLGPUs: 0 -> missing (no OpenCL)\n");
    EXPECT_EQ(Diff("a=1\nglgpu[0].x=1\n", "b=2\nglgpu[0].y=2\n"), "a: 1 -> missing\n"
                                                                  "b: missing -> 2\n"
                                                                  "glgpu[0].x: 1 -> missing\n"
                                                                  "glgpu[0].y: missing -> 2\n");
}

Sample Named(int count, const char* first, const char* second)
{
    return Sample(count, 0)
        .Set("glgpu[0].GLName", std::string("\"") + first + "\"")
        .Set("glgpu[1].GLName", std::string("\"") + second + "\"");
}

TEST(Diff, MatchesDevicesByName)
{
    EXPECT_EQ(Diff(Named(2, "A", "B"), Named(2, "B", "A")), "glgpu[0] \"A\": now glgpu[1]\n"
                                                            "glgpu[1] \"B\": now glgpu[0]\n");
    EXPECT_EQ(Diff(Named(2, "A", "B"), Named(2, "B", "A").Set("glgpu[0].GLMemoryMB", "1")),
              "glgpu[0] \"A\": now glgpu[1]\n"
              "glgpu[1] \"B\": now glgpu[0]\n"
              "glgpu[1].GLMemoryMB: 24564 -> 1\n");
    EXPECT_EQ(Diff(Named(2, "A", "B"), Named(1, "B", "")),
              "NumGLGPUs: 2 -> 1\n"
              "glgpu[0] \"A\": only in the first report\n"
              "glgpu[1] \"B\": now glgpu[0]\n");
    EXPECT_EQ(Diff(Named(1, "A", ""), Named(2, "B", "A")),
              "NumGLGPUs: 1 -> 2\n"
              "glgpu[0] \"B\": only in the second report\n"
              "glgpu[0] \"A\": now glgpu[1]\n");
}

TEST(Diff, MatchesEqualNamesByIndex)
{
    EXPECT_EQ(Diff(Named(2, "A", "A"), Named(2, "A", "A").Set("glgpu[1].GLMemoryMB", "1")),
              "glgpu[1].GLMemoryMB: 24564 -> 1\n");
    EXPECT_EQ(Diff(Named(2, "A", "A"), Named(2, "B", "A").Set("glgpu[1].GLMemoryMB", "1")),
              "glgpu[0].GLName: \"A\" -> \"B\"\n"
              "glgpu[1].GLMemoryMB: 24564 -> 1\n");
    const auto name = [](const std::vector<const char*>& names) {
        std::string text;
        for (std::size_t index = 0; index < names.size(); ++index)
            text += "glgpu[" + std::to_string(index) + "].GLName=\"" + names[index] + "\"\n";
        return text;
    };
    EXPECT_EQ(Diff(name({"A", "A", "B", "B"}), name({"B", "B", "A", "A"})),
              "glgpu[0] \"A\": now glgpu[2]\n"
              "glgpu[1] \"A\": now glgpu[3]\n"
              "glgpu[2] \"B\": now glgpu[0]\n"
              "glgpu[3] \"B\": now glgpu[1]\n");
}

TEST(Diff, MatchesTheRestByIndex)
{
    EXPECT_EQ(Diff(Named(1, "A", ""), Named(1, "B", "")), "glgpu[0].GLName: \"A\" -> \"B\"\n");
    EXPECT_EQ(Diff("glgpu[0].GLVendor=\"A\"\n", "glgpu[0].GLVendor=\"B\"\n"),
              "glgpu[0].GLVendor: \"A\" -> \"B\"\n");
    EXPECT_EQ(Diff("glgpu[0].x=1\n", "clgpu[0].x=1\n"), "glgpu[0]: only in the first report\n"
                                                        "clgpu[0]: only in the second report\n");
    // Two devices without a name aren't the same for that.
    EXPECT_EQ(Diff("glgpu[0].x=1\n", "glgpu[1].x=1\n"), "glgpu[0]: only in the first report\n"
                                                        "glgpu[1]: only in the second report\n");
}

TEST(Diff, ReportsRawLines)
{
    EXPECT_EQ(Diff("a=1\nx\ny\ny\n", "y\na=1\nz\x1B\n"),
              "other line, only in the first report: x\n"
              "other line, only in the first report: y\n"
              "other line, only in the second report: z\\x1B\n");
    EXPECT_EQ(Diff("a=1\nx\n", "x\na=1\n"), "");
}

TEST(Diff, LeadsWithWhatMatters)
{
    EXPECT_EQ(Diff(Sample(2, 1).GetText(), Sample(2, 1)
                                                   .Set("Tester", "\"Another\"")
                                                   .Set("NumGLGPUs", "3")
                                                   .Set("OGLContextCreated", "0")
                                                   .Set("glgpu[0].GLMemoryMB", "1")
                                                   .Set("glgpu[1].GLFrameBufferOK", "0")
                                                   .Set("clgpu[0].CLBandwidth", "1e+11")
                                                   .Set("clgpu[0].CLName", "\"B\"")
                                                   .EndAfter("clgpu[0].CLBandwidth")
                                                   .GetText() +
                                               "x\n"),
              "report: whole -> broken off before clgpu[0].CLCompute "
              "(1 answer only in the first report)\n"
              "OGLContextCreated: 1 -> 0\n"
              "glgpu[1].GLFrameBufferOK: 1 -> 0\n"
              "NumGLGPUs: 2 -> 3\n"
              "glgpu[2]: only in the second report\n"
              "Tester: \"Pixmere\" -> \"Another\"\n"
              "glgpu[0].GLMemoryMB: 24564 -> 1\n"
              "clgpu[0].CLName: \"Accelerator 4000\" -> \"B\"\n"
              "clgpu[0].CLBandwidth: 8.34512e+11 -> 1e+11 (-88 %)\n"
              "other line, only in the second report: x\n");
}

// A crash leaves out many keys, whose lines would hide what matters.
TEST(Diff, HasOneLineForARunThatEndedBefore)
{
    const std::string whole = Sample(1, 2).GetText();
    const auto endAfter = [](const char* key) { return Sample(1, 2).EndAfter(key).GetText(); };
    EXPECT_EQ(Diff(whole, endAfter("glgpu[0].GLVersion")),
              "report: whole -> broken off before glgpu[0].IsIntegratedGLGPU "
              "(60 answers only in the first report)\n");
    EXPECT_EQ(Diff(endAfter("glgpu[0].GLVersion"), whole),
              "report: broken off before glgpu[0].IsIntegratedGLGPU -> whole "
              "(60 answers only in the second report)\n");
    EXPECT_EQ(Diff(endAfter("glgpu[0].GLVersion"), endAfter("glgpu[0].GLName")),
              "report: broken off before glgpu[0].IsIntegratedGLGPU -> "
              "broken off before glgpu[0].GLVendor (3 answers only in the second report)\n");
    EXPECT_EQ(Diff(whole, ""), "report: whole -> empty (66 answers only in the first report)\n");
    EXPECT_EQ(Diff(Sample(1, 0), Sample(1, 0).Set("assayStart", "")),
              "report: whole -> broken off\n");
    ComparisonOptions all;
    all.fAll = true;
    EXPECT_EQ(DiffWith(Sample(0, 1).GetText(), Sample(0, 1).EndAfter("NumGLGPUs").GetText(), all),
              "report: whole -> broken off before NumCLGPUs (13 answers only in the first report)\n"
              "NumCLGPUs: 1 -> missing (run ended before)\n"
              "clgpu[0] \"Accelerator 4000\": only in the first report\n");
}

TEST(Diff, OfRunsThatEndedAtTheSamePlace)
{
    const char* const end = "glgpu[0].GLVendor";
    const std::string report = "report: broken off before glgpu[1].GLVendor -> "
                               "broken off before glgpu[1].GLVendor ";
    EXPECT_EQ(Diff(Named(2, "A", "B").EndAfter(end), Named(2, "B", "A").EndAfter(end)),
              report + "(1 answer only in the first report, 1 answer only in the second report)\n"
                       "glgpu[0] \"A\": now glgpu[1]\n"
                       "glgpu[1] \"B\": now glgpu[0]\n");
    EXPECT_EQ(Diff(Named(2, "A", "B").EndAfter(end), Named(2, "B", "C").EndAfter(end)),
              report + "(1 answer only in the second report)\n"
                       "glgpu[0] \"A\": only in the first report\n"
                       "glgpu[1] \"C\": only in the second report\n"
                       "glgpu[1] \"B\": now glgpu[0]\n");
    EXPECT_EQ(Diff(Named(2, "B", "C").EndAfter(end), Named(2, "A", "B").EndAfter(end)),
              report + "(1 answer only in the first report)\n"
                       "glgpu[1] \"C\": only in the first report\n"
                       "glgpu[0] \"A\": only in the second report\n"
                       "glgpu[0] \"B\": now glgpu[1]\n");
}

TEST(Diff, NamesADeviceThatTheOtherRunDidNotCount)
{
    EXPECT_EQ(Diff(Sample(2, 0), Sample(1, 0).EndAfter("glgpu[0].GLVersion")),
              "report: whole -> broken off before glgpu[0].IsIntegratedGLGPU "
              "(36 answers only in the first report)\n"
              "NumGLGPUs: 2 -> 1\n"
              "glgpu[1] \"Accelerator 4000\": only in the first report\n");
}

TEST(Diff, HasOneLineForADeviceThatFailed)
{
    const std::string good = Sample(1, 0).GetText();
    const auto failAt = [](const char* key) {
        return Sample(1, 0).Fail("glgpu[0]", key).GetText();
    };
    EXPECT_EQ(Diff(good, failAt("GLName")), "glgpu[0].tests: passed -> failed at GLName "
                                            "(33 answers only in the first report)\n");
    EXPECT_EQ(Diff(failAt("GLDriver"), failAt("GLName")),
              "glgpu[0].tests: failed at GLDriver -> failed at GLName "
              "(8 answers only in the first report)\n");
    EXPECT_EQ(Diff(failAt("GLName"), failAt("GLName")), "");
    EXPECT_EQ(Diff(failAt("GLName"), Sample(1, 0).EndAfter("glgpu[0].GLVersion").GetText()),
              "report: whole -> broken off before glgpu[0].IsIntegratedGLGPU "
              "(3 answers only in the first report)\n"
              "glgpu[0].tests: failed at GLName -> not finished\n");
    EXPECT_EQ(Diff(good, good + "# 00009.x Testing terminated for glgpu[0]\n"),
              "glgpu[0].tests: passed -> failed\n");
    ComparisonOptions all;
    all.fAll = true;
    EXPECT_EQ(DiffWith(Sample(0, 1).GetText(),
                       Sample(0, 1).Fail("clgpu[0]", "CLBandwidth").GetText(), all),
              "clgpu[0].tests: passed -> failed at CLBandwidth "
              "(2 answers only in the first report)\n"
              "clgpu[0].CLBandwidth: 8.34512e+11 -> missing (device failed before)\n"
              "clgpu[0].CLCompute: 1234.56 -> missing (device failed before)\n");
}

TEST(Diff, ShowsConstantsOnlyIfAsked)
{
    ComparisonOptions all;
    all.fAll = true;
    const std::string before = "gputag.GL_A=1\na=1\n";
    const std::string after = "gputag.GL_A=2\na=1\n";
    EXPECT_EQ(Diff(before, after), "");
    EXPECT_EQ(DiffWith(before, after, all), "gputag.GL_A: 1 -> 2\n");
}

TEST(Diff, KeepsWhatIsTheSameIfAsked)
{
    ComparisonOptions options;
    const Report report = ReadReport(Sample(1, 1).GetText());
    EXPECT_TRUE(CompareReports(report, report, options).fSame.empty());
    options.fKeepSame = true;
    const Report other = ReadReport(
        Sample(1, 1).Set("glgpu[0].GLMemoryMB", "1").Set("clgpu[0].CLCompute", "1234.5").GetText());
    const Comparison comparison = CompareReports(report, other, options);
    // All lines but the two time stamps and the memory.
    EXPECT_EQ(comparison.fSame.size(), report.GetLines().size() - 3);
    EXPECT_EQ(comparison.fSame.front().fBefore->fKey, "Tester");
    EXPECT_EQ(comparison.fSame.front().fDevice, nullptr);
    EXPECT_EQ(comparison.fSame.back().fBefore->fLine->fValue, "1234.56");
    EXPECT_EQ(comparison.fSame.back().fAfter->fLine->fValue, "1234.5");
    EXPECT_EQ(comparison.fSame.back().fDevice->fTag, "clgpu[0]");
}

} // namespace
} // namespace assay_host
