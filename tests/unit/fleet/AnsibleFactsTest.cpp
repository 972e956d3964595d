#include "fleet/AnsibleFacts.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include <nlohmann/json.hpp>

#include "Lines.h"
#include "Samples.h"
#include "report/Warnings.h"

namespace assay_host {
namespace {

using Json = nlohmann::json;

Json Get(const std::string& report, Verdict verdict = Verdict::kComplete)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fReason = "A \xFF reason.";
    RunFacts facts;
    facts.fHostVersion = "1.2.3";
    facts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    std::ostringstream out;
    WriteAnsibleFacts(out, ReadReport(report), outcome, facts);
    EXPECT_EQ(out.str().find('\n'), out.str().size() - 1);
    return Json::parse(out.str());
}

TEST(AnsibleFacts, AreOneObject)
{
    const Json facts = Get(Sample(1, 1).GetText());
    EXPECT_EQ(facts["verdict"], "complete");
    EXPECT_EQ(facts["reason"], "A \\xFF reason.");
    EXPECT_EQ(facts["time"], "2026-11-22T01:26:02Z");
    EXPECT_EQ(facts["version"], "1.2.3");
    EXPECT_EQ(facts["warnings"], Json::array());
    EXPECT_EQ(facts["opengl"], Json::parse(R"({"usable": "hardware",
        "text": "OpenGL works on graphics hardware.",
        "devices": [{"device": "glgpu[0]", "name": "Accelerator 4000",
            "vendor": "Example Corporation", "version": "4.1",
            "driver": "C:\\drivers\\example64.dll", "driver_version": "31.0.15.2802",
            "failed": false, "software": false, "integrated": false, "shaders_compile": true,
            "framebuffers_work": true, "memory_bytes": 25757220864}]})"));
    EXPECT_EQ(facts["opencl"]["devices"][0]["copy_bytes_per_second"], 834512000000);
    EXPECT_EQ(facts["opencl"]["devices"][0]["compute_score"], 1234.56);
}

TEST(AnsibleFacts, HaveTheWarningsOfARun)
{
    const std::string report = Sample(2, 0)
                                   .Set("glgpu[0].GLFrameBufferOK", "0")
                                   .Set("glgpu[1].GLFrameBufferOK", "0")
                                   .GetText();
    Json expected = Json::array();
    const Report read = ReadReport(report);
    for (const Warning& warning : GetWarnings(GetAnswers(read), {}))
        expected.push_back(GetWarningText(warning));
    EXPECT_EQ(expected.size(), 2U);
    EXPECT_EQ(Get(report)["warnings"], expected);
}

TEST(AnsibleFacts, LeaveOutWhatIsNotKnown)
{
    const Json facts = Get(Sample(1, 1)
                               .Set("glgpu[0].GLMemoryMB", "0")
                               .Set("glgpu[0].GLName", "\"\xFF\"")
                               .EndAfter("glgpu[0].GLRenderer")
                               .GetText(),
                           Verdict::kCrashed);
    const Json device = facts["opengl"]["devices"][0];
    EXPECT_FALSE(device.contains("memory_bytes"));
    EXPECT_FALSE(device.contains("shaders_compile"));
    EXPECT_EQ(device["name"], "\\xFF");
    EXPECT_EQ(facts["opengl"]["usable"], "broken");
    EXPECT_EQ(facts["opencl"]["devices"], Json::array());
    EXPECT_EQ(facts["verdict"], "crashed");
}

// A report as assay prints it has neither a time nor a version.
TEST(AnsibleFacts, LeaveOutWhatAFileDoesNotHave)
{
    std::ostringstream out;
    WriteAnsibleFacts(out, ReadReport(Sample(1, 1).GetText()), RunOutcome(), RunFacts());
    const Json facts = Json::parse(out.str());
    EXPECT_FALSE(facts.contains("time"));
    EXPECT_FALSE(facts.contains("version"));
    EXPECT_TRUE(facts.contains("verdict"));
}

} // namespace
} // namespace assay_host
