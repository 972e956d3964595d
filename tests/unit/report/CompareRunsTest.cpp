#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/CompareRuns.h"
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

} // namespace
} // namespace assay_host
