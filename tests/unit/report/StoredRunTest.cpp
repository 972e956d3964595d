#include <gtest/gtest.h>

#include <functional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "Lines.h"
#include "Samples.h"
#include "report/JsonDocument.h"
#include "report/JsonEvents.h"
#include "report/JsonReader.h"

namespace assay_host {
namespace {

using Json = nlohmann::ordered_json;

RunFacts MakeFacts()
{
    RunFacts facts;
    facts.fHostVersion = "1.2.3";
    facts.fChildVersion = {{}, "its file can't be read"};
    facts.fEnvironment = {
        {"Example OS \xFF", {}}, {{}, "no build"},       {"Linux 6.1", {}}, {"x86_64", {}},
        {"machine", {}},         "2026-11-22T01:26:02Z", "+01:00"};
    return facts;
}

// An outcome in which every member has a value of its own.
RunOutcome MakeFullOutcome(Verdict verdict)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fCommand = {"assay", "-verbose=1", "\xFF"};
    outcome.fExitStatus = 2;
    outcome.fTermination = "signal 11 (Segmentation fault)";
    outcome.fReason = "A reason.";
    outcome.fSeconds = 1.5;
    outcome.fTimeoutSeconds = 60;
    outcome.fLastReportLine = "NumGLGPUs=1";
    outcome.fLastLogLine = "# log \x80";
    outcome.fErrorLines = {"first", "", "\xC3"};
    outcome.fLostOutputBytes = 12;
    outcome.fLostErrorBytes = 34;
    outcome.fCauses = {{"glgpu[0].GLVendor", "a cause \xFF"}};
    outcome.fLowerBounds = {{"clgpu[1].CLBandwidth", 123456789.125}};
    outcome.fLeftBehind = true;
    outcome.fDrivers = {
        {{DeviceKind::kOpenGL, "/lib/libEGL.so.1.1.0", {"1.1.0", {}}, {"c16a", {}}},
         {DeviceKind::kOpenCL, "/lib/\xFE.so", {{}, "no version"}, {{}, "no build id"}}},
        {}};
    return outcome;
}

std::string Write(const StoredRun& run)
{
    std::ostringstream out;
    WriteDocument(out, run.fReport, run.fOutcome, run.fFacts);
    return out.str();
}

StoredRun ReadRun(const std::string& document)
{
    std::istringstream in(document);
    return ReadDocumentRun(in);
}

TEST(StoredRun, ADocumentIsReadBackWhole)
{
    const Report report = ReadReport(Sample(2, 1).Set("clgpu[0].CLName", "\"\xFE\"").GetText());
    for (const Verdict verdict :
         {Verdict::kComplete, Verdict::kFailedTests, Verdict::kUsageError, Verdict::kCrashed,
          Verdict::kHung, Verdict::kNeverStarted, Verdict::kInterrupted}) {
        const StoredRun full = {report, MakeFullOutcome(verdict), MakeFacts()};
        const std::string document = Write(full);
        EXPECT_EQ(Write(ReadRun(document)), document);
        StoredRun bare = {Report(), RunOutcome(), MakeFacts()};
        bare.fOutcome.fVerdict = verdict;
        EXPECT_EQ(Write(ReadRun(Write(bare))), Write(bare));
    }
}

TEST(StoredRun, TheFirstSchemaHasNoFacts)
{
    const RunOutcome outcome = MakeFullOutcome(Verdict::kCrashed);
    std::ostringstream out;
    WriteFirstDocument(out, ReadReport(Sample(1, 1).GetText()), outcome);
    const StoredRun run = ReadRun(out.str());
    EXPECT_TRUE(run.fOutcome.fCauses.empty());
    EXPECT_EQ(run.fOutcome.fDrivers.fReason, "the document does not have them");
    EXPECT_TRUE(run.fFacts.fEnvironment.fTime.empty());
    EXPECT_EQ(run.fFacts.fEnvironment.fKernel.fReason, "the first schema has none");
    EXPECT_EQ(run.fFacts.fChildVersion.fReason, "the first schema has none");
    EXPECT_EQ(run.fExtent, OutcomeExtent::kNoCauses);
    std::ostringstream again;
    WriteFirstDocument(again, run.fReport, run.fOutcome);
    EXPECT_EQ(again.str(), out.str());
}

TEST(StoredRun, EventsAreReadBackWhole)
{
    const Report report = ReadReport(Sample(1, 1).GetText());
    const RunOutcome outcome = MakeFullOutcome(Verdict::kHung);
    std::string events = MakeStartEvent(outcome.fCommand, MakeFacts());
    for (const ReportLine& line : report.GetLines())
        events += MakeLineEvent(line, 0.5);
    events += MakeErrorLineEvent("first", 0.5);
    const std::string unfinished = events;
    events += MakeEndEvent(GetAnswers(report), outcome);
    std::istringstream in(events);
    EXPECT_EQ(Write(ReadEventsRun(in)), Write({report, outcome, MakeFacts()}));

    std::istringstream cut(unfinished);
    const StoredRun run = ReadEventsRun(cut);
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kComplete);
    EXPECT_EQ(run.fOutcome.fReason, "The report is whole; how assay ended was not stored.");
    EXPECT_EQ(run.fOutcome.fCommand, outcome.fCommand);
    EXPECT_EQ(run.fFacts.fHostVersion, "1.2.3");
    EXPECT_EQ(run.fExtent, OutcomeExtent::kNone);
}

TEST(StoredRun, EventsOfTheFirstSchemaHaveNoFacts)
{
    std::istringstream in(MakeFirstStartEvent({"assay"}) + MakeFirstEndEvent({}));
    const StoredRun run = ReadEventsRun(in);
    EXPECT_EQ(run.fFacts.fChildVersion.fReason, "the first schema has none");
    EXPECT_EQ(run.fExtent, OutcomeExtent::kNoCauses);
}

TEST(StoredRun, AnEmptyReasonIsNone)
{
    const StoredRun run = {Report(), MakeFullOutcome(Verdict::kCrashed), MakeFacts()};
    Json document = Json::parse(Write(run));
    document["versions"]["assay"]["reason"] = "";
    document["drivers"] = {{"known", false}, {"reason", ""}};
    const StoredRun read = ReadRun(document.dump());
    EXPECT_EQ(read.fFacts.fChildVersion.fReason, "no reason is given");
    EXPECT_EQ(read.fOutcome.fDrivers.fReason, "no reason is given");
    document["drivers"]["reason"] = "a reason";
    EXPECT_EQ(ReadRun(document.dump()).fOutcome.fDrivers.fReason, "a reason");
}

TEST(StoredRun, OfAReportAlone)
{
    const RunOutcome whole = MakeOutcomeOfReport(ReadReport(Sample(1, 0).GetText()));
    EXPECT_EQ(whole.fVerdict, Verdict::kComplete);
    EXPECT_EQ(whole.fDrivers.fReason, "they were not stored");
    EXPECT_EQ(whole.fLastReportLine, "assayEnd=\"2026-11-21_10:49:36\"");
    const RunOutcome stopped =
        MakeOutcomeOfReport(ReadReport(Sample(1, 0).EndAfter("glgpu[0].GLVersion").GetText()));
    EXPECT_EQ(stopped.fVerdict, Verdict::kFailedTests);
    EXPECT_EQ(stopped.fReason, "The report stopped while reading facts of a device "
                               "(glgpu[0].IsIntegratedGLGPU); how assay ended was not stored.");
    EXPECT_EQ(stopped.fLastReportLine, "glgpu[0].GLVersion=\"4.1\"");
    EXPECT_FALSE(stopped.fExitStatus);
    EXPECT_TRUE(stopped.fLowerBounds.empty());
    const std::string log = "# 00009.2026.11.22_10:00:00.000(+00.000)[tid=1] "
                            "GPUImplHardware::checkBandwidthCL: ";
    const RunOutcome measured = MakeOutcomeOfReport(
        ReadReport(log + "0 of 100\n" + log + "seconds=0.1\nclgpu[0].CLBandwidth=1\n" +
                   "assayEnd=\"2026-11-21_10:49:36\"\n"));
    ASSERT_EQ(measured.fLowerBounds.size(), 1U);
    EXPECT_EQ(measured.fLowerBounds[0].fKey, "clgpu[0].CLBandwidth");
    EXPECT_EQ(measured.fReason, "The report stopped; how assay ended was not stored.");
}

// A report with the child's log.
TEST(StoredRun, OfAReportWithItsLogHasWhatTheLogSays)
{
    const std::string log = "# 00009.2026.11.22_10:00:00.000(+00.000)[tid=1] ";
    const RunOutcome outcome = MakeOutcomeOfReport(
        ReadReport("QGFOGLInitialized=1\n" + log + "Cannot create default ContextOffscreen: x\n" +
                   log + "driver files are logged\n" + log + "loaded for OpenGL: /lib/a.so\n" +
                   "OGLContextCreated=0\n# Cannot create default ContextOffscreen: y\n"));
    EXPECT_EQ(outcome.FindCause("OGLContextCreated"), "x");
    EXPECT_EQ(outcome.fCauses.size(), 1U);
    ASSERT_EQ(outcome.fDrivers.fFiles.size(), 1U);
    EXPECT_EQ(outcome.fDrivers.fFiles[0].fPath, "/lib/a.so");
    EXPECT_TRUE(outcome.fDrivers.IsKnown());
}

// What is wrong in a document, and how it is named.
TEST(StoredRun, NamesWhatIsWrong)
{
    struct Case {
        const char* fPointer;
        Json fValue; // null: the member is removed
        const char* fText;
    };
    const std::vector<Case> cases = {
        {"/outcome", nullptr, "the document: \"outcome\" is missing"},
        {"/outcome", 1, "the document: \"outcome\" is not an object"},
        {"/outcome/verdict", "odd", "the document.outcome: \"verdict\" is \"odd\", which is none"},
        {"/outcome/verdict", nullptr, "the document.outcome: \"verdict\" is missing"},
        {"/outcome/exitStatus", "1", "the document.outcome: \"exitStatus\" is not an integer"},
        {"/outcome/termination", 1, "the document.outcome: \"termination\" is not a string"},
        {"/outcome/reason", 1, "the document.outcome: \"reason\" is not a string"},
        {"/outcome/seconds", "1", "the document.outcome: \"seconds\" is not a number"},
        {"/outcome/timeoutSeconds", "1",
         "the document.outcome: \"timeoutSeconds\" is not a number"},
        {"/outcome/lastReportLine", 1, "the document.outcome: \"lastReportLine\" is not a string"},
        {"/outcome/lastLogLine", 1, "the document.outcome: \"lastLogLine\" is not a string"},
        {"/outcome/errorLines", 1, "the document.outcome: \"errorLines\" is not an array"},
        {"/outcome/errorLines/0", 1,
         "the document.outcome: \"errorLines\" has an element that is not a string"},
        {"/outcome/lostOutputBytes", -1,
         "the document.outcome: \"lostOutputBytes\" is not a count"},
        {"/outcome/lostErrorBytes", 0.5, "the document.outcome: \"lostErrorBytes\" is not a count"},
        {"/outcome/leftBehind", 0, "the document.outcome: \"leftBehind\" is not a bool"},
        {"/outcome/causes", 0, "the document.outcome: \"causes\" is not an array"},
        {"/outcome/causes/0/key", 0, "the document.outcome.causes: \"key\" is not a string"},
        {"/outcome/causes/0/text", nullptr, "the document.outcome.causes: \"text\" is missing"},
        {"/outcome/lowerBounds", 0, "the document.outcome: \"lowerBounds\" is not an array"},
        {"/outcome/lowerBounds/0/key", 0,
         "the document.outcome.lowerBounds: \"key\" is not a string"},
        {"/outcome/lowerBounds/0/value", "1",
         "the document.outcome.lowerBounds: \"value\" is not a number"},
        {"/drivers", 0, "the document: \"drivers\" is not an object"},
        {"/drivers/known", 1, "the document.drivers: \"known\" is not a bool"},
        {"/drivers/known", false, "the document.drivers: \"reason\" is missing"},
        {"/drivers/files", 0, "the document.drivers: \"files\" is not an array"},
        {"/drivers/files/0/interface", "Vulkan",
         "the document.drivers: \"interface\" is \"Vulkan\", which is none"},
        {"/drivers/files/0/path", 0, "the document.drivers: \"path\" is not a string"},
        {"/drivers/files/1/buildId", nullptr, "the document.drivers: \"buildId\" is missing"},
        {"/command", nullptr, "the document: \"command\" is missing"},
        {"/versions", nullptr, "the document: \"versions\" is missing"},
        {"/versions/assay", 1, "the document.versions: \"assay\" is not an object"},
        {"/versions/assay/known", 1, "the document.versions.assay: \"known\" is not a bool"},
        {"/versions/assay/reason", nullptr, "the document.versions.assay: \"reason\" is missing"},
        {"/environment", "x", "the document: \"environment\" is not an object"},
        {"/environment/time", nullptr, "the document.environment: \"time\" is missing"},
        {"/environment/kernel/value", 6,
         "the document.environment.kernel: \"value\" is not a string"},
    };
    const StoredRun run = {Report(), MakeFullOutcome(Verdict::kCrashed), MakeFacts()};
    for (const Case& each : cases) {
        Json document = Json::parse(Write(run));
        const Json::json_pointer pointer(each.fPointer);
        if (each.fValue.is_null())
            document.at(pointer.parent_pointer()).erase(pointer.back());
        else
            document.at(pointer) = each.fValue;
        try {
            ReadRun(document.dump());
            ADD_FAILURE() << each.fPointer;
        } catch (const std::runtime_error& failure) {
            EXPECT_STREQ(failure.what(), each.fText) << each.fPointer;
        }
    }
}

} // namespace
} // namespace assay_host
