// All outputs must name the same next line of an incomplete report.
#include <random>
#include <regex>
#include <sstream>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "report/Answers.h"
#include "report/JsonDocument.h"
#include "report/TextView.h"
#include "supervise/Judge.h"
#include "support/Reports.h"

namespace assay_host {
namespace {

using Lines = std::vector<std::string>;

// Makes a run in which the device fails at the test of this key. `logs`: with the log line.
Lines MakeFailingRun(int glCount, int clCount, const std::string& tag, const std::string& key,
                     bool logs)
{
    Lines lines;
    bool isLost = false;
    for (const Lines& group : MakeWholeRun(glCount, clCount)) {
        const std::string answer = group.empty() ? "" : group.back();
        const bool isOfDevice = answer.rfind(tag + ".", 0) == 0;
        if (!isLost && answer.rfind(tag + "." + key, 0) == 0) {
            isLost = true;
            lines.insert(lines.end(), group.begin(), group.end() - 1);
            if (logs)
                lines.push_back("# 00009.2026.11.21_10:49:36 Testing terminated for " + tag);
        } else if (!isLost || !isOfDevice) {
            lines.insert(lines.end(), group.begin(), group.end());
        }
    }
    return lines;
}

std::vector<Lines> MakeFailingRuns(bool logs)
{
    return {
        MakeFailingRun(2, 1, "glgpu[0]", "GLName", logs),
        MakeFailingRun(2, 1, "glgpu[1]", "glGetString", logs),
        MakeFailingRun(2, 1, "glgpu[0]", "glGetProgramivARB", logs),
        MakeFailingRun(3, 0, "glgpu[1]", "extension[QGF::OGL::GL_ARB_TEX", logs),
        MakeFailingRun(1, 2, "clgpu[0]", "CLBandwidth", logs),
        MakeFailingRun(1, 2, "clgpu[1]", "CLCompute", logs),
    };
}

std::vector<Lines> MakeWholeRuns()
{
    std::vector<Lines> runs;
    for (int glCount = 0; glCount <= 3; ++glCount)
        for (int clCount = 0; clCount <= 2; ++clCount)
            runs.push_back(Join(MakeWholeRun(glCount, clCount)));
    return runs;
}

RunOutcome JudgeCrash(const ReportProgress& progress)
{
    Evidence evidence;
    evidence.fReport = progress;
    evidence.fEnd = pmutil::ChildEnd{pmutil::kEndedByCrash, 0, "signal 11"};
    RunOutcome outcome;
    outcome.fCommand = {"assay"};
    Judge(evidence, outcome);
    return outcome;
}

// Returns "glgpu[0].GLName" for "... while reading facts of a device (glgpu[0].GLName)."; empty if
// the reason names no key.
std::string GetKeyOfReason(const std::string& reason)
{
    std::smatch found;
    std::regex_search(reason, found, std::regex(" while .*\\((\\S+)\\)\\.$"));
    return found.str(1);
}

void ExpectOneKeyInAllOutputs(const Report& report, const RunOutcome& outcome,
                              const std::string& key)
{
    std::ostringstream json;
    WriteDocument(json, report, outcome, {});
    const auto next = nlohmann::json::parse(json.str())["report"]["next"];
    EXPECT_EQ(next.is_null() ? "" : next.get<std::string>(), key);

    std::ostringstream text;
    PrintText(text, report, outcome, 400);
    std::smatch found;
    const std::string shown = text.str();
    std::regex_search(shown, found, std::regex("Next line +(\\S+)"));
    EXPECT_EQ(found.str(1), key);
}

// A part of 20000 reports, so that several processes can share the work.
class NextLineOfCutReports : public testing::TestWithParam<int> {};

constexpr int kParts = 20;

TEST_P(NextLineOfCutReports, IsTheSameInAllOutputs)
{
    constexpr int kReports = 20000 / kParts;
    constexpr int kFullInterval = 100; // of the reports that all outputs show
    std::vector<Report> runs = {ReadReport(Join(MakeWholeRun(1, -1)))};
    for (const auto& some : {MakeWholeRuns(), MakeFailingRuns(false), MakeFailingRuns(true)})
        for (const Lines& lines : some)
            runs.push_back(ReadReport(lines));
    std::mt19937 random(20261121U + static_cast<unsigned>(GetParam()));
    int differing = 0;
    for (int number = 0; number < kReports; ++number) {
        const std::vector<ReportLine>& lines = runs[random() % runs.size()].GetLines();
        const std::size_t end = random() % (lines.size() + 1);
        Report report;
        ReportProgress progress;
        for (std::size_t line = 0; line < end; ++line) {
            const bool isDropped = random() % 20 == 0;
            if (isDropped)
                continue;
            report.Add(lines[line]);
            progress.Add(lines[line]);
        }
        const RunOutcome outcome = JudgeCrash(progress);
        const std::string next = GetAnswers(report).fNext;
        if (progress.HasValues() && GetKeyOfReason(outcome.fReason) != next)
            ++differing;
        if (progress.HasValues() && number % kFullInterval == 0 && !report.IsWhole())
            ExpectOneKeyInAllOutputs(report, outcome, next);
    }
    EXPECT_EQ(differing, 0);
}

INSTANTIATE_TEST_SUITE_P(Part, NextLineOfCutReports, testing::Range(0, kParts));

// Ends the report after each line, also before gputag lines and after failures in the log.
TEST(NextLine, IsTheOneThatTheChildPrintsNext)
{
    std::vector<Lines> runs = MakeWholeRuns();
    for (const Lines& failing : MakeFailingRuns(true))
        runs.push_back(failing);
    for (const Lines& run : runs) {
        const Report whole = ReadReport(run);
        ReportProgress progress;
        Report report;
        for (const ReportLine& line : whole.GetLines()) {
            if (line.fKind == LineKind::kValue && progress.HasValues()) {
                EXPECT_EQ(GetAnswers(report).fNext, line.fKey);
                EXPECT_EQ(GetKeyOfReason(JudgeCrash(progress).fReason), line.fKey);
            }
            report.Add(line);
            progress.Add(line);
        }
        EXPECT_EQ(GetAnswers(report).fNext, "");
    }
}

TEST(NextLine, IsTheEndStampUntilThatIsWhole)
{
    for (const char* end : {"assayEnd=", "assayEnd=x\n", "assayEnd=\"2026-11-21_10:49:36\""}) {
        const Report report = ReadReport("Tester=\"Pixmere\"\nNumGLGPUs=0\n" + std::string(end));
        EXPECT_EQ(GetAnswers(report).fNext, "assayEnd") << end;
    }
}

} // namespace
} // namespace assay_host
