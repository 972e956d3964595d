#include "fleet/NodeFeatures.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"

namespace assay_host {
namespace {

using testing::AllOf;
using testing::Not;

constexpr char kPrefix[] = "feature.node.kubernetes.io/assay.";

std::string GetText(const std::string& report, Verdict verdict = Verdict::kComplete)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    std::ostringstream out;
    WriteNodeFeatures(out, ReadReport(report), outcome);
    return out.str();
}

struct Features {
    std::vector<std::string> fLabels; // without the prefix
    std::vector<std::string> fOthers;
};

// Reads a feature file as Node Feature Discovery does: the directive applies to the next feature.
Features Read(const std::string& text)
{
    Features features;
    std::istringstream in(text);
    bool isLabel = true;
    for (std::string line; std::getline(in, line);) {
        if (line.front() == '#') {
            isLabel = isLabel && line != "# +no-label";
            continue;
        }
        EXPECT_EQ(line.rfind(kPrefix, 0), 0U) << line;
        (isLabel ? features.fLabels : features.fOthers).push_back(line.substr(sizeof kPrefix - 1));
        isLabel = true;
    }
    return features;
}

TEST(NodeFeatures, LabelsTheNode)
{
    EXPECT_THAT(Read(GetText(Sample(1, 1).GetText())).fLabels,
                testing::ElementsAre(
                    "verdict=complete", "opengl.usable=hardware", "opengl.devices=1",
                    "opengl.name=Accelerator-4000", "opengl.vendor=Example-Corporation",
                    "opengl.version=4.1", "opengl.driver=C-drivers-example64.dll",
                    "opengl.driver_version=31.0.15.2802", "opengl.failed=false",
                    "opengl.software=false", "opengl.integrated=false",
                    "opengl.shaders_compile=true", "opengl.framebuffers_work=true",
                    "opengl.memory_bytes=25757220864", "opencl.usable=hardware", "opencl.devices=1",
                    "opencl.name=Accelerator-4000", "opencl.vendor=Example-Corporation",
                    "opencl.version=3.0-CUDA", "opencl.driver_version=528.02",
                    "opencl.failed=false", "opencl.software=false", "opencl.integrated=false",
                    "opencl.memory_bytes=25757220864"));
}

// A label that changes with each run would change the node with each run.
TEST(NodeFeatures, KeepMeasurementsAndSingleDevicesFromTheLabels)
{
    const Features features = Read(GetText(Sample(2, 1).GetText()));
    EXPECT_THAT(features.fLabels, testing::Each(testing::AllOf(Not(testing::HasSubstr("score")),
                                                               Not(testing::HasSubstr("second")),
                                                               Not(testing::HasSubstr("l.0")),
                                                               Not(testing::HasSubstr("l.1")))));
    EXPECT_THAT(features.fOthers,
                AllOf(testing::Contains("opengl.1.name=Accelerator 4000"),
                      testing::Contains("opencl.0.copy_bytes_per_second=834512000000"),
                      testing::Contains("opencl.0.compute_score=1234.56")));
    EXPECT_EQ(features.fOthers.size(), 32U);
}

TEST(NodeFeatures, DescribeTheDeviceThatDecided)
{
    const std::string text = GetText(Sample(2, -1)
                                         .Set("glgpu[0].GLFrameBufferOK", "0")
                                         .Set("glgpu[0].GLName", "\"First\"")
                                         .Set("glgpu[1].GLName", "\"Second\"")
                                         .GetText());
    EXPECT_THAT(Read(text).fLabels, AllOf(testing::Contains("opengl.name=Second"),
                                          testing::Contains("opengl.usable=hardware")));
}

TEST(NodeFeatures, LeaveOutWhatIsNotKnown)
{
    const std::string text = GetText(
        Sample(1, 1).Set("glgpu[0].GLMemoryMB", "0").Set("glgpu[0].GLName", "\"((\"").GetText());
    EXPECT_THAT(Read(text).fLabels,
                testing::Each(testing::AllOf(Not(testing::HasSubstr("gl.memory")),
                                             Not(testing::HasSubstr("gl.name=")))));
    EXPECT_THAT(Read(text).fOthers, testing::Contains("opengl.0.name=(("));
    const std::string nameless = GetText(
        Sample(1, 0).Set("glgpu[0].GLName", "\"\"").Set("glgpu[0].GLRenderer", "\"\"").GetText());
    EXPECT_THAT(Read(nameless).fOthers, testing::Each(Not(testing::StartsWith("opengl.0.name="))));
    EXPECT_THAT(Read(GetText("", Verdict::kNeverStarted)).fLabels,
                testing::ElementsAre("verdict=never-started", "opengl.usable=unknown",
                                     "opencl.usable=unknown"));
}

TEST(NodeFeatures, HaveValuesOfLabels)
{
    EXPECT_EQ(MakeLabelValue("plain"), "plain");
    EXPECT_EQ(MakeLabelValue("azAZ09"), "azAZ09");
    EXPECT_EQ(MakeLabelValue("a`b{c@d[e/f:g"), "a-b-c-d-e-f-g");
    EXPECT_EQ(MakeLabelValue("a b  c"), "a-b-c");
    EXPECT_EQ(MakeLabelValue("-._a_b.c-_."), "a_b.c");
    EXPECT_EQ(MakeLabelValue("\xC3\xA9-\xC3\xA9"), "");
    EXPECT_EQ(MakeLabelValue("(R) x(TM)"), "R-x-TM");
    EXPECT_EQ(MakeLabelValue(""), "");
    EXPECT_EQ(MakeLabelValue(std::string(64, 'x')), std::string(63, 'x'));
    EXPECT_EQ(MakeLabelValue(std::string(62, 'x') + "--y"), std::string(62, 'x'));
}

// Names and values that Kubernetes accepts, whatever the driver returns.
TEST(NodeFeatures, AreValidLabels)
{
    const std::regex label(R"([a-zA-Z0-9]([a-zA-Z0-9._-]{0,61}[a-zA-Z0-9])?)");
    const std::string text =
        GetText(Sample(1, 1)
                    .Set("glgpu[0].GLVendor",
                         "\"=\n# +no-label\n\x1B[31m\xFF" + std::string(999, ' ') + "\"")
                    .Set("clgpu[0].CLName", "\"" + std::string(9999, '\\') + "\"")
                    .GetText());
    for (const std::string& line : Read(text).fLabels) {
        const std::size_t mark = line.find('=');
        EXPECT_TRUE(std::regex_match("assay." + line.substr(0, mark), label)) << line;
        EXPECT_TRUE(std::regex_match(line.substr(mark + 1), label)) << line;
    }
}

// A report of OpenGL devices whose features are larger by so many bytes than those of short names.
std::string GetPaddedText(int devices, std::size_t more)
{
    Sample sample(devices, 0);
    // The labels are those of the first device.
    for (int device = 1; device < devices; ++device) {
        const std::size_t part = std::min<std::size_t>(more, 199);
        sample.Set("glgpu[" + std::to_string(device) + "].GLName",
                   "\"" + std::string(part + 1, 'N') + "\"");
        more -= part;
    }
    return GetText(sample.GetText());
}

TEST(NodeFeatures, AreLeftOutFromTheFirstByteBeyondTheLimit)
{
    // 80 bytes are kept free for the line that counts them.
    constexpr std::size_t kLimit = 65536 - 80;
    int devices = 2;
    while (GetPaddedText(devices + 1, 0).find("left out") == std::string::npos)
        ++devices;
    const std::size_t more = kLimit - GetPaddedText(devices, 0).size();
    const std::string full = GetPaddedText(devices, more);
    EXPECT_EQ(full.size(), kLimit);
    EXPECT_EQ(full.find("left out"), std::string::npos);
    EXPECT_THAT(GetPaddedText(devices, more + 1),
                testing::EndsWith("\n# left out beyond 65536 bytes: 1\n"));
}

TEST(NodeFeatures, FitIntoTheLargestFile)
{
    const std::string text = GetText(
        Sample(8, 8).Set("glgpu[3].GLVendor", "\"" + std::string(60000, 'x') + "\"").GetText());
    EXPECT_LE(text.size(), kMaxFeatureFileBytes);
    EXPECT_EQ(text.find("left out"), std::string::npos);
    const std::string large = GetText(Sample(256, 256).GetText());
    EXPECT_LE(large.size(), kMaxFeatureFileBytes);
    EXPECT_GT(large.size(), kMaxFeatureFileBytes - 200);
    const auto count = [](const std::string& file) {
        static const std::regex gFeature("# \\+no-label\n");
        return std::distance(std::sregex_iterator(file.begin(), file.end(), gFeature), {});
    };
    const auto leftOut = 256 * count(GetText(Sample(1, 1).GetText())) - count(large);
    EXPECT_GT(leftOut, 0);
    EXPECT_THAT(large, testing::EndsWith(
                           "\n# left out beyond 65536 bytes: " + std::to_string(leftOut) + "\n"));
    EXPECT_THAT(Read(large).fLabels, testing::Contains("opencl.devices=256"));
}

} // namespace
} // namespace assay_host
