#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "SavedJson.h"
#include "report/CompareRuns.h"
#include "report/ComparedRuns.h"
#include "report/DiffJson.h"
#include "report/DiffText.h"

namespace assay_host {
namespace {

StoredRun MakeRun(const std::string& text, Verdict verdict)
{
    StoredRun run;
    run.fReport = ReadReport(text);
    run.fOutcome.fVerdict = verdict;
    if (verdict == Verdict::kCrashed)
        run.fOutcome.fTermination = "signal 11 (Segmentation fault)";
    else
        run.fOutcome.fExitStatus = verdict == Verdict::kComplete ? 0 : 2;
    return run;
}

std::string Diff(const StoredRun& before, const StoredRun& after, bool identity = false)
{
    ComparisonOptions options;
    options.fIdentity = identity;
    std::ostringstream out;
    PrintDiff(out, CompareRuns(before, after, options));
    return out.str();
}

const char* const kStop = "glgpu[0].GLVersion";
const char* const kStopLine = "report: whole -> broken off before glgpu[0].IsIntegratedGLGPU "
                              "(48 answers only in the first report)\n";

TEST(CompareRuns, LeadsWithTheVerdict)
{
    const StoredRun good = MakeRun(Sample(1, 1).GetText(), Verdict::kComplete);
    const StoredRun crashed = MakeRun(Sample(1, 1).EndAfter(kStop).GetText(), Verdict::kCrashed);
    EXPECT_EQ(Diff(good, crashed),
              std::string("verdict: complete -> crashed: signal 11 (Segmentation fault)\n") +
                  kStopLine +
                  "opengl.usable: hardware -> broken (crashed)\n"
                  "opencl.usable: hardware -> unknown (ended-before)\n");
    EXPECT_EQ(Diff(good, good), "");
    EXPECT_EQ(Diff(crashed, crashed), "");
}

TEST(CompareRuns, TellsTheEndsOfOneVerdictApart)
{
    StoredRun first = MakeRun("", Verdict::kCrashed);
    StoredRun second = first;
    second.fOutcome.fTermination = "signal 6 (Aborted)";
    EXPECT_EQ(Diff(first, second), "verdict: crashed: signal 11 (Segmentation fault) -> "
                                   "crashed: signal 6 (Aborted)\n");
    first = MakeRun(Sample(0, 0).GetText(), Verdict::kComplete);
    second = first;
    second.fOutcome.fExitStatus = 9;
    EXPECT_EQ(Diff(first, second), "verdict: complete -> complete: exit status 9\n");
    first.fOutcome.fVerdict = Verdict::kHung;
    first.fOutcome.fExitStatus.reset();
    EXPECT_EQ(Diff(first, second), "verdict: hung -> complete: exit status 9\n");
    // The host's own signal says nothing.
    first = MakeRun("", Verdict::kHung);
    first.fOutcome.fExitStatus.reset();
    second = first;
    second.fOutcome.fTermination = "signal 9 (Killed)";
    EXPECT_EQ(Diff(first, second), "");
}

TEST(CompareRuns, WhatOneFileDoesNotHaveIsNotCompared)
{
    const std::string text = Sample(1, 1).EndAfter(kStop).GetText();
    const StoredRun crashed = MakeRun(text, Verdict::kCrashed);
    StoredRun plain;
    plain.fReport = ReadReport(text);
    plain.fOutcome = MakeOutcomeOfReport(plain.fReport);
    plain.fExtent = OutcomeExtent::kNone;
    EXPECT_EQ(Diff(crashed, plain), "");
    EXPECT_EQ(Diff(plain, crashed), "");
    StoredRun good = MakeRun(Sample(1, 1).GetText(), Verdict::kComplete);
    EXPECT_EQ(Diff(good, plain), std::string(kStopLine) +
                                     "opengl.usable: hardware -> broken (ended)\n"
                                     "opencl.usable: hardware -> unknown (ended-before)\n");
    // The causes, which the first schema doesn't have, tell why there is no OpenGL.
    const std::string none =
        Sample(0, 0).Set("QGFOGLInitialized", "0").Set("OGLContextCreated", "0").GetText();
    StoredRun second = MakeRun(none, Verdict::kComplete);
    second.fOutcome.fCauses = {{"QGFOGLInitialized", "libEGL.so.1 can't be opened"}};
    StoredRun first = MakeRun(none, Verdict::kComplete);
    EXPECT_EQ(Diff(first, second), "opengl.usable: absent (no-device) -> absent (no-library)\n");
    first.fExtent = OutcomeExtent::kNoCauses;
    EXPECT_EQ(Diff(first, second), "");
    EXPECT_EQ(Diff(second, first), "");
}

TEST(CompareRuns, ComparesTheIdentityIfAsked)
{
    StoredRun first = MakeRun(Sample(0, 0).GetText(), Verdict::kComplete);
    StoredRun second =
        MakeRun(Sample(0, 0).Set("assayStart", "\"2027\"").GetText(), Verdict::kComplete);
    first.fFacts.fEnvironment.fHost = {"one\x1B", ""};
    first.fFacts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    second.fFacts.fEnvironment.fHost = {"", "not asked for"};
    second.fFacts.fEnvironment.fTime = "2027-11-22T01:26:02Z";
    EXPECT_EQ(Diff(first, second), "");
    EXPECT_EQ(Diff(first, second, true), "host: one\\x1B -> not known\n"
                                         "time: 2026-11-22T01:26:02Z -> 2027-11-22T01:26:02Z\n"
                                         "assayStart: \"2026-11-21_10:49:35\" -> \"2027\"\n");
}

TEST(DiffJson, HasEachSideOfEachDifference)
{
    ComparedRuns runs("a\xFF.txt", MakeRun(Sample(2, 1).GetText(), Verdict::kComplete));
    runs.Add("same", MakeRun(Sample(2, 1).GetText(), Verdict::kComplete), {});
    ComparisonOptions options;
    options.fIdentity = true;
    StoredRun second;
    second.fReport = ReadReport(Sample(1, 1)
                                    .Set("QGFCoreInitialized", "2")
                                    .Set("clgpu[0].CLCompute", "600")
                                    .Set("clgpu[0].CUDAVersion", "")
                                    .Set("glgpu[0].CanCompileProgramGLSL", "0")
                                    .GetText() +
                                "glgpu[0].New=1\n");
    second.fOutcome.fVerdict = Verdict::kComplete;
    second.fOutcome.fExitStatus = 0;
    second.fFacts.fEnvironment.fHost = {"b", ""};
    runs.Add("b", std::move(second), options);
    std::ostringstream out;
    WriteDiffDocument(out, runs, "1.2.3");
    const Json document = Json::parse(out.str());
    EXPECT_EQ(out.str(), document.dump(2) + "\n");
    EXPECT_EQ(document["schema"], kDiffSchemaVersion);
    EXPECT_EQ(document["version"], "1.2.3");
    EXPECT_EQ(document["before"], "a\uF7FF.txt");
    const Json& same = document["comparisons"][0];
    EXPECT_EQ(same, Json::parse(R"({"after": "same", "same": true,
        "headline": "The reports do not differ.", "steps": [], "differences": []})"));
    const Json& other = document["comparisons"][1];
    EXPECT_EQ(other["after"], "b");
    EXPECT_EQ(other["same"], false);
    EXPECT_EQ(other["headline"], "OpenGL: hardware in the first report, broken in the second.");
    EXPECT_EQ(other["steps"].size(), 4U);
    EXPECT_EQ(other["differences"], Json::parse(R"json([
        {"group": "usable", "deviceBefore": null, "deviceAfter": null, "key": "opengl.usable",
         "label": "OpenGL",
         "before": {"value": "hardware",
                    "text": "hardware (glgpu[0]): OpenGL works on graphics hardware."},
         "after": {"value": "broken (shader-trial-failed)",
                   "text": "broken (glgpu[0]): OpenGL does not work: glgpu[0]: a realistic pair of shaders does not compile and link."
}
, "note" : null
},
        {"group": "trials", "deviceBefore": null, "deviceAfter": null,
         "key": "QGFCoreInitialized", "label": "QGFCoreInitialized",
         "before": {"value": "1", "text": "yes"}, "after": {"value": "2", "text": "2"},
         "note": null},
        {"group": "trials", "deviceBefore": "glgpu[0]", "deviceAfter": "glgpu[0]",
         "key": "CanCompileProgramGLSL", "label": "Shaders compile",
         "before": {"value": "1", "text": "yes"}, "after": {"value": "0", "text": "no"},
         "note": null},
        {"group": "devices", "deviceBefore": null, "deviceAfter": null, "key": "NumGLGPUs",
         "label": "NumGLGPUs", "before": {"value": "2", "text": "2"},
         "after": {"value": "1", "text": "1"}, "note": null},
        {"group": "devices", "deviceBefore": "glgpu[1]", "deviceAfter": null, "key": null,
         "label": "Device",
         "before": {"value": "glgpu[1]", "text": "glgpu[1] \"Accelerator 4000\""},
         "after": {"value": null, "text": "not in the report"}, "note": null},
        {"group": "facts", "deviceBefore": "glgpu[0]", "deviceAfter": "glgpu[0]", "key": "New",
         "label": "New", "before": {"value": null, "text": "not in the report"},
         "after": {"value": "1", "text": "1"}, "note": null},
        {"group": "facts", "deviceBefore": "clgpu[0]", "deviceAfter": "clgpu[0]",
         "key": "CUDAVersion", "label": "CUDA version",
         "before": {"value": "12.0.89", "text": "12.0.89"},
         "after": {"value": null, "text": "not printed by this device"}, "note": null},
        {"group": "measurements", "deviceBefore": "clgpu[0]", "deviceAfter": "clgpu[0]",
         "key": "CLCompute", "label": "Compute score",
         "before": {"value": "1234.56", "text": "1234.56 (no unit; more is better)"},
         "after": {"value": "600", "text": "600 (no unit; more is better)"},
         "note": "-51.4 %"},
        {"group": "identity", "deviceBefore": null, "deviceAfter": null, "key": "host",
         "label": "Machine", "before": {"value": null, "text": "not known"},
         "after": {"value": "b", "text": "b"}, "note": null}])json"));
}

} // namespace
} // namespace assay_host
