#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "SavedJson.h"
#include "report/JsonDocument.h"
#include "report/JsonEvents.h"
#include "report/JsonReader.h"
#include "report/NextSteps.h"

namespace assay_host {
namespace {

RunFacts MakeFacts()
{
    RunFacts facts;
    facts.fHostVersion = "1.2.3";
    facts.fChildVersion = {"", "its file has none"};
    facts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    facts.fEnvironment.fOffset = "+01:00";
    facts.fEnvironment.fSystem = {"System \xFF", ""};
    facts.fEnvironment.fBuild = {"12", ""};
    facts.fEnvironment.fKernel = {"Linux 6.1", ""};
    facts.fEnvironment.fArchitecture = {"x86_64", ""};
    facts.fEnvironment.fHost = {"", "not asked for"};
    return facts;
}

RunOutcome MakeOutcome(Verdict verdict)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fCommand = {"assay"};
    return outcome;
}

std::string GetText(const Report& report, const RunOutcome& outcome)
{
    std::ostringstream out;
    WriteDocument(out, report, outcome, MakeFacts());
    return out.str();
}

Json Document(const std::string& text, const RunOutcome& outcome = MakeOutcome(Verdict::kComplete))
{
    return SaveDocument(Json::parse(GetText(ReadReport(text), outcome)));
}

std::vector<std::string> Names(const Json& object)
{
    std::vector<std::string> names;
    for (const auto& item : object.items())
        names.push_back(item.key());
    return names;
}

TEST(JsonSecondDocument, HasTheSameMembersInTheSameOrderForEachRun)
{
    const std::vector<std::string> names = {
        "schema",   "versions",  "environment", "command", "outcome",        "drivers", "usable",
        "warnings", "nextSteps", "report",      "devices", "devicesLeftOut", "lines"};
    EXPECT_EQ(Names(Document(Sample(1, 1).GetText())), names);
    EXPECT_EQ(Names(Document("", RunOutcome())), names);
    EXPECT_EQ(Document("")["schema"], 2);
}

TEST(JsonSecondDocument, NamesProgramsAndSystem)
{
    const Json document = Document("");
    EXPECT_EQ(document["versions"],
              Json::parse(R"({"assay-host": {"known": true, "value": "1.2.3"}, )"
                          R"("assay": {"known": false, "reason": "its file has none"}})"));
    EXPECT_EQ(document["environment"]["time"], "2026-11-22T01:26:02Z");
    EXPECT_EQ(document["environment"]["utcOffset"], "+01:00");
    EXPECT_EQ(document["environment"]["system"],
              Json::parse(R"({"known": true, "value": "System \uF7FF"})"));
    EXPECT_EQ(document["environment"]["host"],
              Json::parse(R"({"known": false, "reason": "not asked for"})"));
}

TEST(JsonSecondDocument, SaysWhatCanBeUsed)
{
    const Json usable = Document(Sample(1, 1).GetText())["usable"];
    EXPECT_EQ(
        usable["opengl"],
        Json::parse(R"({"answer": "hardware", "reason": "trials-passed", )"
                    R"("device": "glgpu[0]", "text": "OpenGL works on graphics hardware."})"));
    EXPECT_EQ(usable["opencl"]["answer"], "hardware");
    const Json crashed =
        Document(Sample(1, 1).EndAfter("NumCLGPUs").GetText(), MakeOutcome(Verdict::kCrashed));
    EXPECT_EQ(crashed["usable"]["opengl"]["answer"], "hardware");
    EXPECT_EQ(crashed["usable"]["opencl"]["answer"], "broken");
    EXPECT_EQ(Document("", RunOutcome())["usable"]["opencl"]["device"], nullptr);
}

TEST(JsonSecondDocument, HasWarningsAndCauses)
{
    RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    outcome.fCauses = {{"OGLContextCreated", "\xFE"}};
    const Json document = Document(Sample(1, 0)
                                       .Set("OGLContextCreated", "0")
                                       .Set("glgpu[0].GLRenderer", "\"softpipe\"")
                                       .GetText(),
                                   outcome);
    EXPECT_EQ(
        document["warnings"],
        Json::parse(R"([{"code": "no-default-context", "device": null, "text": )"
                    R"("No OpenGL context could be created on the first display device.", )"
                    R"("cause": "\\xFE"}, )"
                    R"({"code": "software", "device": "glgpu[0]", "text": )"
                    R"("software renderer, no graphics hardware: softpipe", "cause": null}])"));
    EXPECT_EQ(document["outcome"]["causes"],
              Json::parse(R"([{"key": "OGLContextCreated", "text": "\uF7FE"}])"));
    EXPECT_EQ(document["devices"][0]["software"], Json::parse(R"({"known": true, "flag": true})"));
}

TEST(JsonSecondDocument, HasLowerBounds)
{
    EXPECT_EQ(Document("")["outcome"]["lowerBounds"], Json::array());
    RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    outcome.fLowerBounds = {{"clgpu[0].CLBandwidth", 1.5e9}, {"clgpu[1].CLBandwidth", 0.1}};
    EXPECT_EQ(Document(Sample(0, 2).GetText(), outcome)["outcome"]["lowerBounds"],
              Json::parse(R"([{"key": "clgpu[0].CLBandwidth", "value": 1.5e9}, )"
                          R"({"key": "clgpu[1].CLBandwidth", "value": 0.1}])"));
}

TEST(JsonSecondDocument, HasTheNextSteps)
{
    EXPECT_EQ(Document(Sample(1, 1).GetText())["nextSteps"], Json::array());
    const std::string broken = Sample(1, 0).Set("glgpu[0].GLFrameBufferOK", "0").GetText();
    const RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    const Report report = ReadReport(broken);
    const std::vector<std::string> steps = GetNextSteps(GetAnswers(report), outcome);
    ASSERT_GT(steps.size(), 1U);
    EXPECT_EQ(Document(broken, outcome)["nextSteps"], Json(steps));
}

TEST(JsonSecondDocument, HasTheFilesOfDrivers)
{
    EXPECT_EQ(Document("", RunOutcome())["drivers"],
              Json::parse(R"({"known": false, "reason": "the child was not started"})"));
    RunOutcome outcome = MakeOutcome(Verdict::kCrashed);
    outcome.fDrivers.fReason.clear();
    EXPECT_EQ(Document("", outcome)["drivers"], Json::parse(R"({"known": true, "files": []})"));
    outcome.fDrivers.fFiles = {
        {DeviceKind::kOpenGL, "/lib/libEGL.so.1.1.0", {"1.1.0", {}}, {"c16a", {}}},
        {DeviceKind::kOpenCL, "/lib/\xFE.so", {{}, "no"}, {{}, "none"}}};
    EXPECT_EQ(Document("", outcome)["drivers"], Json::parse(R"({"known": true, "files": [
        {"interface": "OpenGL", "path": "/lib/libEGL.so.1.1.0",
         "version": {"known": true, "value": "1.1.0"}, "buildId": {"known": true, "value": "c16a"}},
        {"interface": "OpenCL", "path": "/lib/\uF7FE.so",
         "version": {"known": false, "reason": "no"},
         "buildId": {"known": false, "reason": "none"}}]})"));
}

TEST(JsonSecondDocument, HasNumbersAndFlags)
{
    const Json document = Document(Sample(1, 1).GetText());
    const Json& gl = document["devices"][0]["keys"];
    EXPECT_EQ(gl["GLVersion"], Json::parse(R"({"known": true, "value": "4.1"})"));
    EXPECT_EQ(gl["GLMemoryMB"],
              Json::parse(R"({"known": true, "value": "24564", "number": 24564})"));
    EXPECT_EQ(gl["HasGLNPOTSupport"],
              Json::parse(R"({"known": true, "value": "1", "number": 1, "flag": true})"));
    EXPECT_EQ(gl["IsIntegratedGLGPU"]["flag"], false);
    EXPECT_EQ(gl["extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]"]["flag"], false);
    EXPECT_EQ(gl["glGetIntegerv[GL_MAX_TEXTURE_UNITS]"],
              Json::parse(R"({"known": true, "value": "[4]", "numbers": [4]})"));
    EXPECT_EQ(document["report"]["keys"]["OGLContextCreated"]["flag"], true);
    EXPECT_EQ(document["report"]["keys"]["NumGLGPUs"],
              Json::parse(R"({"known": true, "value": "1", "number": 1})"));
}

TEST(JsonSecondDocument, SaysWhatIsNotKnown)
{
    const Json keys = Document(Sample(1, 0)
                                   .Set("glgpu[0].GLMemoryMB", "0")
                                   .Set("glgpu[0].GLVendorID", "0")
                                   .Set("glgpu[0].GLName", "\"\"")
                                   .Set("glgpu[0].GLDriver", "\"?\"")
                                   .GetText())["devices"][0]["keys"];
    const auto unknown = [](const char* value, const char* reason) {
        return Json{{"known", false}, {"value", value}, {"reason", reason}};
    };
    const char* const noAdapter = "no adapter of the system matches the device";
    EXPECT_EQ(keys["GLMemoryMB"], unknown("0", "no source has the value"));
    EXPECT_EQ(keys["GLVendorID"], unknown("0", noAdapter));
    EXPECT_EQ(keys["GLName"], unknown("", noAdapter));
    EXPECT_EQ(keys["IsIntegratedGLGPU"], unknown("0", noAdapter));
    EXPECT_EQ(keys["GLDriver"], unknown("?", "the system's adapter lists do not have it"));

    const Json broken = Document(Sample(1, 1).EndAfter("glgpu[0].GLName").GetText(),
                                 MakeOutcome(Verdict::kCrashed))["devices"][0];
    EXPECT_EQ(broken["keys"]["GLVendor"],
              Json::parse(R"({"known": false, "value": null, "reason": "run ended before"})"));
    EXPECT_EQ(broken["software"],
              Json::parse(R"({"known": false, "reason": "no answer names the renderer"})"));
}

TEST(JsonSecondDocument, IsWrittenLikeADump)
{
    for (const std::string& text : {std::string(), Sample(2, 2).GetText(), std::string("x\n# y")}) {
        const std::string document = GetText(ReadReport(text), MakeOutcome(Verdict::kHung));
        EXPECT_EQ(document, Json::parse(document).dump(2) + "\n");
    }
}

TEST(JsonSecondDocument, RestoresTheReport)
{
    for (const std::string& text :
         {Sample(2, 2).GetText(), std::string(), std::string("# \xFF\r\na=\"x")}) {
        std::istringstream in(GetText(ReadReport(text), MakeOutcome(Verdict::kComplete)));
        EXPECT_EQ(ReadDocument(in).ToText(), text);
    }
}

TEST(JsonSecondEvents, HaveTheNewPartsAtStartAndEnd)
{
    const Json document = Document("");
    const Json start = SaveEvent(MakeStartEvent({"assay"}, MakeFacts()));
    EXPECT_EQ(Names(start), (std::vector<std::string>{"event", "seconds", "schema", "versions",
                                                      "environment", "command"}));
    EXPECT_EQ(start["schema"], 2);
    EXPECT_EQ(start["environment"], document["environment"]);
    const Report report = ReadReport(Sample(1, 1).GetText());
    const RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    const Json end = SaveEvent(MakeEndEvent(GetAnswers(report), outcome));
    EXPECT_EQ(Names(end), (std::vector<std::string>{"event", "seconds", "outcome", "drivers",
                                                    "usable", "warnings", "nextSteps"}));
    const Json whole = Document(Sample(1, 1).GetText(), outcome);
    EXPECT_EQ(end["outcome"], whole["outcome"]);
    EXPECT_EQ(end["drivers"], whole["drivers"]);
    EXPECT_EQ(end["usable"], whole["usable"]);
    EXPECT_EQ(end["warnings"], whole["warnings"]);
    EXPECT_EQ(end["nextSteps"], whole["nextSteps"]);

    std::string events = MakeStartEvent({"assay"}, MakeFacts());
    for (const ReportLine& line : report.GetLines())
        events += MakeLineEvent(line, 1);
    EXPECT_EQ(ReadEvents(events + MakeEndEvent(GetAnswers(report), outcome)).ToText(),
              report.ToText());
}

} // namespace
} // namespace assay_host
