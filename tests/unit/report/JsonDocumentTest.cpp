#include <gtest/gtest.h>

#include <limits>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "SavedJson.h"
#include "report/Bytes.h"
#include "report/JsonBytes.h"
#include "report/JsonEvents.h"
#include "report/JsonReader.h"

namespace assay_host {
namespace {

RunOutcome GoodOutcome()
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kComplete;
    outcome.fCommand = {"assay", "-verbose=0"};
    outcome.fExitStatus = 0;
    outcome.fReason = "All tests ran, and the report is whole.";
    outcome.fSeconds = 0.25;
    outcome.fTimeoutSeconds = 60;
    outcome.fLastReportLine = "assayEnd=\"2026-11-21_10:49:36\"";
    return outcome;
}

Json Document(std::string_view text, const RunOutcome& outcome = GoodOutcome())
{
    return SaveDocument(MakeDocument(ReadReport(text), outcome));
}

std::vector<std::string> Names(const Json& object)
{
    std::vector<std::string> names;
    for (const auto& item : object.items())
        names.push_back(item.key());
    return names;
}

TEST(JsonDocument, HasTheSameMembersInTheSameOrderForEachRun)
{
    const std::vector<std::string> names = {"schema",  "command",        "outcome", "report",
                                            "devices", "devicesLeftOut", "lines"};
    EXPECT_EQ(Names(Document(Sample(1, 1).GetText())), names);
    EXPECT_EQ(Names(Document("")), names);
    EXPECT_EQ(Names(Document("", RunOutcome())), names);
    EXPECT_EQ(Document("")["schema"], 1);
}

TEST(JsonDocument, HasTheOutcome)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kCrashed;
    outcome.fCommand = {"/opt/as say", "-exit=1", "\xFF"};
    outcome.fTermination = "signal 11 (Segmentation fault)";
    outcome.fReason = "The child died.";
    outcome.fSeconds = 1.5;
    outcome.fTimeoutSeconds = 60;
    outcome.fLastReportLine = "a=1";
    outcome.fLastLogLine = "# log";
    outcome.fErrorLines = {"exception: x", "\xFE"};
    outcome.fLostOutputBytes = std::numeric_limits<std::uint64_t>::max();
    outcome.fLostErrorBytes = 3;
    outcome.fLeftBehind = true;
    const Json document = Document("a=1\n", outcome);
    EXPECT_EQ(document["command"], Json::parse(R"(["/opt/as say", "-exit=1", "\uF7FF"])"));
    const Json expected = Json::parse(
        R"({"verdict": "crashed", "status": 3, "exitStatus": null, )"
        "\"termination\": \"signal 11 (Segmentation fault)\", "
        R"("reason": "The child died.", "seconds": 1.5, "timeoutSeconds": 60.0, )"
        R"("lastReportLine": "a=1", "lastLogLine": "# log", )"
        R"("errorLines": ["exception: x", "\uF7FE"], "lostOutputBytes": 18446744073709551615, )"
        R"("lostErrorBytes": 3, "leftBehind": true})");
    EXPECT_EQ(document["outcome"], expected);

    const Json none = Json::parse(
        R"({"verdict": "never-started", "status": 5, "exitStatus": null, "termination": null, )"
        R"("reason": "", "seconds": 0.0, "timeoutSeconds": null, "lastReportLine": null, )"
        R"("lastLogLine": null, "errorLines": [], "lostOutputBytes": 0, "lostErrorBytes": 0, )"
        R"("leftBehind": false})");
    EXPECT_EQ(Document("", RunOutcome())["outcome"], none);
}

TEST(JsonDocument, HasEachVerdictWithItsStatus)
{
    for (int status = 0; status <= static_cast<int>(Verdict::kInterrupted); ++status) {
        RunOutcome outcome;
        outcome.fVerdict = static_cast<Verdict>(status);
        const Json json = Document("", outcome)["outcome"];
        EXPECT_EQ(json["status"], status);
        EXPECT_EQ(json["verdict"], GetVerdictName(outcome.fVerdict));
    }
}

TEST(JsonDocument, ReplacesTimesThatJsonCannotHold)
{
    RunOutcome outcome;
    outcome.fSeconds = std::numeric_limits<double>::quiet_NaN();
    outcome.fTimeoutSeconds = std::numeric_limits<double>::infinity();
    const Json json = Document("", outcome)["outcome"];
    EXPECT_EQ(json["seconds"], 0.0);
    EXPECT_EQ(json["timeoutSeconds"], 0.0);
    outcome.fSeconds = -1;
    outcome.fTimeoutSeconds = 0.5;
    EXPECT_EQ(Document("", outcome)["outcome"]["seconds"], 0.0);
    EXPECT_EQ(Document("", outcome)["outcome"]["timeoutSeconds"], 0.5);
}

TEST(JsonDocument, HasEachValueAsTextAndNumber)
{
    const Json document = Document(Sample(1, 1).GetText());
    ASSERT_EQ(document["devices"].size(), 2U);
    const Json& gl = document["devices"][0];
    EXPECT_EQ(gl["tag"], "glgpu[0]");
    EXPECT_EQ(gl["kind"], "OpenGL");
    EXPECT_EQ(gl["index"], 0);
    EXPECT_EQ(gl["complete"], true);
    EXPECT_EQ(gl["failed"], false);
    EXPECT_EQ(gl["keys"].size(), 36U);
    EXPECT_EQ(gl["keys"]["GLVersion"], Json::parse(R"({"value": "4.1"})"));
    EXPECT_EQ(gl["keys"]["GLMemoryMB"], Json::parse(R"({"value": "24564", "number": 24564})"));
    EXPECT_EQ(gl["keys"]["HasGLNPOTSupport"], Json::parse(R"({"value": "1", "number": 1})"));
    EXPECT_EQ(gl["keys"]["glGetIntegerv[GL_MAX_TEXTURE_UNITS]"],
              Json::parse(R"({"value": "[4]", "numbers": [4]})"));
    const Json& cl = document["devices"][1];
    EXPECT_EQ(cl["kind"], "OpenCL");
    EXPECT_EQ(cl["keys"]["CLBandwidth"],
              Json::parse(R"({"value": "8.34512e+11", "number": 8.34512e+11})"));
    EXPECT_EQ(document["report"]["whole"], true);
    EXPECT_EQ(document["report"]["next"], nullptr);
    EXPECT_EQ(document["report"]["keys"]["NumGLGPUs"],
              Json::parse(R"({"value": "1", "number": 1})"));
    EXPECT_EQ(document["report"]["keys"]["Tester"], Json::parse(R"({"value": "Pixmere"})"));
}

TEST(JsonDocument, HasNoNumberForOtherTexts)
{
    const Json keys =
        Document("glgpu[0].GLMemoryMB=many\nglgpu[0].GLVendorID=\nclgpu[0].CLCompute=inf\n"
                 "clgpu[0].CLBandwidth=nan\nclgpu[0].Extra=[1, x]\n");
    EXPECT_EQ(keys["devices"][0]["keys"]["GLMemoryMB"], Json::parse(R"({"value": "many"})"));
    EXPECT_EQ(keys["devices"][0]["keys"]["GLVendorID"], Json::parse(R"({"value": ""})"));
    EXPECT_EQ(keys["devices"][1]["keys"]["CLCompute"], Json::parse(R"({"value": "inf"})"));
    EXPECT_EQ(keys["devices"][1]["keys"]["CLBandwidth"], Json::parse(R"({"value": "nan"})"));
    EXPECT_EQ(keys["devices"][1]["keys"]["Extra"], Json::parse(R"({"value": "[1, x]"})"));
}

TEST(JsonDocument, HasNoNumberThatAReaderWouldChange)
{
    const Json keys = Document("clgpu[0].A=9007199254740993\nclgpu[0].B=18446744073709551615\n"
                               "clgpu[0].C=[1, 9007199254740993]\nclgpu[0].D=9007199254740992\n"
                               "clgpu[0].E=40")["devices"][0]["keys"];
    EXPECT_EQ(keys["A"], Json::parse(R"({"value": "9007199254740993"})"));
    EXPECT_EQ(keys["B"], Json::parse(R"({"value": "18446744073709551615"})"));
    EXPECT_EQ(keys["C"], Json::parse(R"({"value": "[1, 9007199254740993]"})"));
    EXPECT_EQ(keys["D"],
              Json::parse(R"({"value": "9007199254740992", "number": 9007199254740992})"));
    EXPECT_EQ(keys["E"], Json::parse(R"({"value": "40"})")); // its line has no end
}

TEST(JsonDocument, IsWrittenLikeADump)
{
    for (const std::string& text : {std::string(), Sample(1, 1).GetText(), std::string("x\n# y")}) {
        const std::string document = GetDocumentText(ReadReport(text), GoodOutcome());
        EXPECT_EQ(document, Json::parse(document).dump(2) + "\n");
    }
}

TEST(JsonDocument, IsReadInAnyOrderOfMembers)
{
    EXPECT_EQ(
        ReadDocument(Json::parse(R"({"x": [{"lines": [{}]}, [[]]], "lines": [{"z": {"kind": 1},
        "end": "\n", "text": "a=1", "kind": "value", "y": [[]]}], "devices": {}, "schema": 1})"))
            .ToText(),
        "a=1\n");
}

TEST(JsonDocument, LimitsTheNumberOfLines)
{
    const Json line = Json::parse(R"({"kind": "raw", "text": "", "end": "\n"})");
    Json document = {{"schema", 1}, {"lines", Json::array()}};
    document["lines"].get_ref<Json::array_t&>().assign(ReportReader::Limits().fMaxLines, line);
    EXPECT_EQ(ReadDocument(document).GetLines().size(), ReportReader::Limits().fMaxLines);
    document["lines"].push_back(line);
    EXPECT_THROW(ReadDocument(document), std::runtime_error);
}

TEST(JsonDocument, NamesTheReasonForAMissingValue)
{
    const auto reason = [](const char* text) { return Json{{"value", nullptr}, {"reason", text}}; };
    const Json document = Document(Sample(2, 0)
                                       .Fail("glgpu[0]", "GLName")
                                       .Set("glgpu[1].GLVersion", "")
                                       .EndAfter("glgpu[1].GLVendor")
                                       .GetText());
    EXPECT_EQ(document["devices"][0]["keys"]["GLName"], reason("device failed before"));
    EXPECT_EQ(document["devices"][0]["failed"], true);
    EXPECT_EQ(document["devices"][0]["complete"], false);
    EXPECT_EQ(document["devices"][1]["keys"]["GLVersion"], reason("no readable line"));
    EXPECT_EQ(document["devices"][1]["keys"]["GLVendorID"], reason("run ended before"));
    EXPECT_EQ(document["report"]["keys"]["assayEnd"], reason("run ended before"));
    EXPECT_EQ(document["report"]["whole"], false);
    EXPECT_EQ(document["report"]["next"], "glgpu[1].GLVendorID");

    const Json without = Document(Sample(0, 1).Set("clgpu[0].CUDAVersion", "").GetText());
    EXPECT_EQ(without["devices"][0]["keys"]["CUDAVersion"], reason("not printed by this device"));
    EXPECT_EQ(Document(Sample(1, -1).GetText())["report"]["keys"]["NumCLGPUs"],
              reason("no OpenCL"));
}

// Writes the report to a document and reads it back.
Report RoundTrip(const Report& report)
{
    return ReadDocument(SaveDocument(MakeDocument(report, GoodOutcome())));
}

TEST(JsonDocument, RestoresTheReportByteByByte)
{
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte)
        bytes += static_cast<char>(byte);
    for (const std::string& text :
         {Sample(2, 2).GetText(), std::string(), std::string("a=1"),
          "glgpu[0].GLName=\"" + bytes + "\"\r\n", bytes, "# " + bytes + "\r\n\r\n",
          std::string("a=\"open\nglgpu[0].GLName=\"\n\"\nx\r"),
          std::string("a=\"\xED\xA0\x80\xC0\xAF\xEF\x9F\xBF\xEE\xFF\"\n")}) {
        const Report report = ReadReport(text);
        const Report back = RoundTrip(report);
        EXPECT_EQ(back.ToText(), text);
        EXPECT_EQ(back.GetLines(), report.GetLines());
    }
}

TEST(JsonDocument, RestoresCutLines)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 8;
    Report report;
    report.Add(ReadLines("a=\"123456789\"\nb=123456789\r\n# 123456789\n1234567890", 100, limits));
    ASSERT_EQ(report.GetLines().size(), 4U);
    EXPECT_EQ(RoundTrip(report).GetLines(), report.GetLines());
    const Json document = MakeDocument(report, GoodOutcome());
    EXPECT_EQ(document["lines"][0],
              Json::parse(R"({"kind": "value", "text": "a=\"12345", "end": "\n", "cut": true})"));
}

TEST(JsonDocument, HoldsManyKeysAndDevices)
{
    std::string text = "NumGLGPUs=4000000000\n";
    for (int line = 0; line < 8000; ++line) {
        text += "K" + std::to_string(line) + "=1\nglgpu[0].K" + std::to_string(line) +
                "=1\nclgpu[" + std::to_string(line) + "].K=1\n";
    }
    const Report report = ReadReport(text);
    const Json document = MakeDocument(report, GoodOutcome());
    EXPECT_EQ(document["devices"].size(), 512U);
    EXPECT_EQ(document["devicesLeftOut"], 8000 - 256);
    EXPECT_EQ(ReadDocument(document).ToText(), text);
}

TEST(JsonDocument, RejectsOtherDocuments)
{
    struct Row {
        const char* fJson;
        const char* fText;
    };
    const Row rows[] = {
        {"[]", "the document is not an object"},
        {"null", "the document is not an object"},
        {"{}", "the document: \"schema\" is missing"},
        {R"({"schema": "1"})", "the document: \"schema\" is not an integer"},
        {R"({"schema": 3, "lines": []})",
         "the document: \"schema\" is 3, and only 1 and 2 can be read"},
        {R"({"schema": 1})", "the document: \"lines\" is missing"},
        {R"({"schema": 1, "lines": {}})", "the document: \"lines\" is not an array"},
        {R"({"schema": 1, "lines": [1]})", "lines[0] is not an object"},
        {R"({"schema": 1, "lines": [{"kind": "raw", "text": "", "end": ""}, {}]})",
         "lines[1]: \"kind\" is missing"},
        {R"({"schema": 1, "lines": [{"kind": 1}]})", "lines[0]: \"kind\" is not a string"},
        {R"({"schema": 1, "lines": [{"kind": "raw", "text": null}]})",
         "lines[0]: \"text\" is not a string"},
        {R"({"schema": 1, "lines": [{"kind": "raw", "text": ""}]})",
         "lines[0]: \"end\" is missing"},
        {R"({"schema": 1, "lines": [{"kind": "raw", "text": "", "end": "\r"}]})",
         "lines[0]: \"end\" is not a line end"},
        {R"({"schema": 1, "lines": [{"kind": "raw", "text": "", "end": "", "cut": 1}]})",
         "lines[0]: \"cut\" is not a bool"},
        {R"({"schema": 1, "lines": [{"kind": "value", "text": "x", "end": ""}]})",
         "lines[0]: \"text\" is not a line of the kind \"value\""},
        {R"({"schema": 1, "lines": [{"kind": "\u001b", "text": "x", "end": ""}]})",
         "lines[0]: \"text\" is not a line of the kind \"\\x1B\""},
    };
    for (const Row& row : rows) {
        try {
            ReadDocument(Json::parse(row.fJson));
            ADD_FAILURE() << row.fJson;
        } catch (const std::runtime_error& failure) {
            EXPECT_STREQ(failure.what(), row.fText);
        }
    }
}

TEST(JsonDocument, IsReadWithACutThatIsFalse)
{
    const Report report = ReadDocument(Json::parse(
        R"({"schema": 1, "lines": [{"kind": "raw", "text": "", "end": "", "cut": false}]})"));
    EXPECT_FALSE(report.GetLines().at(0).fCut);
}

TEST(JsonDocument, ShortensWhatTheParserSays)
{
    std::istringstream in("{\"schema\": \"" + std::string(300, 'a') + "\x01");
    try {
        ReadDocument(in);
        ADD_FAILURE();
    } catch (const std::runtime_error& failure) {
        const std::string text = failure.what();
        EXPECT_EQ(text.substr(0, 28), "not valid JSON: parse error ");
        EXPECT_EQ(text.size(), std::string("not valid JSON: ").size() + 200);
    }
}

TEST(JsonEvents, AreObjectsThatNameTheirEvent)
{
    EXPECT_TRUE(IsEvent(R"({"event": 1})"));
    for (const char* text : {"", "x", "[1]", "{\"a\": 1}", "{\"a\": {\"event\": 1}}", "\"event\""})
        EXPECT_FALSE(IsEvent(text)) << text;
}

TEST(JsonEvents, HaveTheirForms)
{
    EXPECT_EQ(SaveEvent(MakeFirstStartEvent({"assay", "-x"})),
              Json::parse(R"({"event": "start", "seconds": 0.0, "schema": 1, )"
                          R"("command": ["assay", "-x"]})"));
    const std::vector<ReportLine> lines = ReadLines("a=\"\xFF\"\r\n# b\nc");
    EXPECT_EQ(SaveEvent(MakeLineEvent(lines.at(0), 0.5)),
              Json::parse(R"({"event": "line", "seconds": 0.5, "kind": "value", )"
                          R"("text": "a=\"\uF7FF\"", "end": "\r\n", "key": "a", )"
                          R"("value": "\uF7FF"})"));
    EXPECT_EQ(SaveEvent(MakeLineEvent(lines.at(1), 0.5)),
              Json::parse(R"({"event": "line", "seconds": 0.5, "kind": "comment", "text": "# b", )"
                          R"("end": "\n"})"));
    EXPECT_EQ(SaveEvent(MakeLineEvent(lines.at(2), 0.5)),
              Json::parse(R"({"event": "line", "seconds": 0.5, "kind": "raw", "text": "c", )"
                          R"("end": ""})"));
    ReportLine cut = lines.at(2);
    cut.fCut = true;
    EXPECT_EQ(SaveEvent(MakeLineEvent(cut, -1))["cut"], true);
    EXPECT_EQ(SaveEvent(MakeErrorLineEvent("\x80", 2)),
              Json::parse(R"({"event": "error", "seconds": 2.0, "text": "\uF780"})"));
    const Json end = SaveEvent(MakeFirstEndEvent(GoodOutcome()));
    EXPECT_EQ(Names(end), (std::vector<std::string>{"event", "seconds", "outcome"}));
    EXPECT_EQ(end["event"], "end");
    EXPECT_EQ(end["seconds"], 0.25);
    EXPECT_EQ(end["outcome"], Document("")["outcome"]);
}

std::string Events(const std::string& report)
{
    std::string text = MakeFirstStartEvent({"assay"});
    for (const ReportLine& line : ReadLines(report))
        text += MakeLineEvent(line, 0.5);
    return text + MakeErrorLineEvent("x", 1);
}

TEST(JsonEvents, RestoreTheReport)
{
    const std::string report = Sample(1, 1).GetText() + "a=\"\xFF\n\"\r\n# log\nraw";
    const std::string text = Events(report) + MakeFirstEndEvent(GoodOutcome());
    SaveText(text, ".jsonl");
    EXPECT_EQ(ReadEvents(text).ToText(), report);
}

TEST(JsonEvents, RestoreTheReportOfAKilledHost)
{
    const std::string text = Events("a=1\nb=2\n");
    const std::size_t last = text.rfind("{\"event\":\"line\"");
    for (std::size_t size = last + 1; size < text.find('\n', last); ++size)
        EXPECT_EQ(ReadEvents(text.substr(0, size)).ToText(), "a=1\n") << size;
    EXPECT_EQ(ReadEvents(text.substr(0, text.find('\n', last))).ToText(), "a=1\nb=2\n");
}

TEST(JsonEvents, RejectOtherLines)
{
    struct Row {
        std::string fText;
        const char* fMessage;
    };
    const std::string start = MakeFirstStartEvent({});
    const Row rows[] = {
        {"{}", "line 1: \"event\" is missing"},
        {"[]\n", "line 1 is not a JSON object"},
        {"{", "line 1: not valid JSON: "},
        {start + "1e999\n", "line 2: number overflow parsing '1e999'"},
        {start + "{\"event\": \"line\", \"seconds\": -1e999}\n",
         "line 2: number overflow parsing '-1e999'"},
        {start + "1\n", "line 2 is not a JSON object"},
        {start + "{\"event\": \"line\", \"kind\": \"value\", \"text\": [\"a=1\"]}\n",
         "line 2: \"text\" is not a string"},
        {R"({"event": 1})", "line 1: \"event\" is not a string"},
        {R"({"event": "end"})", "line 1 is not the event \"start\""},
        {R"({"event": "start"})", "line 1: \"schema\" is missing"},
        {R"({"event": "start", "schema": 7})",
         "line 1: \"schema\" is 7, and only 1 and 2 can be read"},
        {start + start, "line 2 is a second event \"start\""},
        {start + "\n" + start, "line 2: not valid JSON: "},
        {start + "{\"event\": \"line\"}\n", "line 2: \"kind\" is missing"},
        {start + "{\"event\": \"li\n", "line 2: not valid JSON: "},
    };
    for (const Row& row : rows) {
        try {
            ReadEvents(row.fText);
            ADD_FAILURE() << row.fText;
        } catch (const std::runtime_error& failure) {
            const std::string message = row.fMessage;
            const bool isStart = message.substr(message.size() - 2) == ": ";
            EXPECT_EQ(
                std::string(failure.what()).substr(0, isStart ? message.size() : std::string::npos),
                message);
        }
    }
}

TEST(JsonBytes, KeepText)
{
    for (const char* text : {"", "plain", "\xC3\xA9", "\xE4\xB8\xAD", "\xF0\x9F\x98\x80",
                             "\xEE\x80\x80", "\xEF\x9D\xBF" /* U+F77F */,
                             "\xEF\xA0\x80" /* U+F800 */, "\xEF\xBF\xBD", "\xF4\x8F\xBF\xBF"}) {
        EXPECT_EQ(EncodeBytes(text), text);
        EXPECT_EQ(DecodeBytes(text), text);
    }
    EXPECT_EQ(DecodeBytes("\xFF\xEF\x9E\x80"), "\xFF\x80");
}

TEST(JsonBytes, EncodeOtherBytesInAPrivateRange)
{
    for (int byte = 0x80; byte < 0x100; ++byte) {
        std::string expected;
        AppendCharacter(expected, 0xF700 + static_cast<char32_t>(byte));
        const std::string bytes(1, static_cast<char>(byte));
        EXPECT_EQ(EncodeBytes(bytes), expected);
        EXPECT_EQ(DecodeBytes(expected), bytes);
    }
    // U+F7C3, and the real character U+F7A9, whose bytes are encoded one by one.
    EXPECT_EQ(EncodeBytes("\xC3"), "\xEF\x9F\x83");
    EXPECT_EQ(EncodeBytes("\xEF\x9E\xA9"), "\xEF\x9F\xAF\xEF\x9E\x9E\xEF\x9E\xA9");
}

TEST(JsonBytes, RoundTrip)
{
    std::vector<std::string> texts = {"\xC3",
                                      "\xE4\xB8",
                                      "\xF0\x9F\x98",
                                      "\xC0\x80",
                                      "\xE0\x80\x80",
                                      "\xF0\x80\x80\x80",
                                      "\xED\xA0\x80",
                                      "\xED\xBF\xBF",
                                      "\xED\xA0\xBD\xED\xB8\x80",
                                      "\xF4\x90\x80\x80",
                                      "\xFF\xFE",
                                      "a\xC3(b",
                                      "\xEF\x9E\x80" /* U+F780 */,
                                      "\xEF\x9F\xBF" /* U+F7FF */,
                                      "\xEF\x9E\x80\x80",
                                      "\xEF\x9E",
                                      "\xEF\xEF\x9E\x80\x9F"};
    for (int first = 0; first < 256; ++first) {
        texts.emplace_back(1, static_cast<char>(first));
        for (int second = 0; second < 256; ++second)
            texts.push_back({static_cast<char>(first), static_cast<char>(second)});
    }
    for (const std::string& text : texts) {
        const std::string encoded = EncodeBytes(text);
        EXPECT_EQ(DecodeBytes(encoded), text);
        EXPECT_EQ(Json::parse(Json(encoded).dump()).get<std::string>(), encoded);
    }
}

} // namespace
} // namespace assay_host
