#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "html/Assets.h"
#include "html/Markup.h"
#include "html/ReportPage.h"
#include "report/Explanations.h"
#include "report/JsonDocument.h"
#include "report/KnownKeys.h"
#include "report/Lines.h"
#include "report/Samples.h"
#include "report/SeriesSamples.h"

namespace assay_host {
namespace {

RunFacts MakeFacts()
{
    RunFacts facts;
    facts.fHostVersion = "1.0.0";
    facts.fChildVersion = {"1.0.0", ""};
    facts.fEnvironment.fSystem = {"Example <OS>", ""};
    facts.fEnvironment.fBuild = {"12.8", ""};
    facts.fEnvironment.fArchitecture = {"x86_64", ""};
    facts.fEnvironment.fKernel = {"", "the kernel does not say it"};
    facts.fEnvironment.fHost = {"", "only with --identify"};
    facts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    facts.fEnvironment.fOffset = "+01:00";
    return facts;
}

RunOutcome MakeOutcome(Verdict verdict)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fCommand = {"bin/assay"};
    outcome.fReason = "The reason <b>.";
    outcome.fSeconds = 0.25;
    if (verdict == Verdict::kComplete)
        outcome.fExitStatus = 0;
    return outcome;
}

std::string WritePage(const std::string& text, const RunOutcome& outcome)
{
    std::ostringstream out;
    WriteReportPage(out, ReadReport(text), outcome, MakeFacts());
    return out.str();
}

bool Has(const std::string& page, const std::string& part)
{
    return page.find(part) != std::string::npos;
}

std::size_t Count(const std::string& page, const std::string& part)
{
    std::size_t count = 0;
    for (std::size_t at = page.find(part); at != std::string::npos; at = page.find(part, at + 1))
        ++count;
    return count;
}

TEST(ReportPage, OfAGoodMachine)
{
    const std::string page = WritePage(Sample(1, 1).GetText(), MakeOutcome(Verdict::kComplete));
    EXPECT_EQ(page.substr(0, 16), "<!DOCTYPE html>\n");
    EXPECT_TRUE(Has(page, "<title>assay: OpenGL works on graphics hardware.</title>"));
    EXPECT_TRUE(Has(page, "<h1>OpenGL works on graphics hardware.</h1>"));
    EXPECT_TRUE(Has(page, "<span class=\"hardware\">hardware</span> (glgpu[0]): OpenGL works"));
    EXPECT_TRUE(Has(page, "<span class=\"hardware\">hardware</span> (clgpu[0]): OpenCL works"));
    EXPECT_FALSE(Has(page, "What to do"));
    EXPECT_FALSE(Has(page, "Warnings"));
    EXPECT_TRUE(Has(page, "<article class=\"card\" id=\"glgpu[0]\"><h2>OpenGL device glgpu[0]: "
                          "Accelerator 4000</h2>"));
    EXPECT_TRUE(Has(page, "<dt>Shaders compile</dt>\n<dd class=\"yes\">yes</dd>"));
    EXPECT_TRUE(Has(page, "<dt>Memory</dt>\n<dd>23.99 GiB</dd>"));
    EXPECT_TRUE(Has(page, "<summary>Limits (10)</summary>"));
    EXPECT_TRUE(Has(page, "<summary>Extensions (10)</summary>"));
    EXPECT_TRUE(Has(page, "<caption>Copy bandwidth (more is better)</caption>"));
    EXPECT_TRUE(Has(page, "<caption>Compute score (more is better)</caption>"));
    EXPECT_TRUE(Has(page, "<dt>System</dt>\n<dd>Example &lt;OS&gt;</dd>"));
    EXPECT_TRUE(Has(page, "<dt>Kernel</dt>\n<dd>not known (the kernel does not say it)</dd>"));
    EXPECT_FALSE(Has(page, "No answer"));
    EXPECT_FALSE(Has(page, "<summary>Others"));
    // The facts in the order of their rows, without the trials.
    EXPECT_TRUE(Has(page, "<dd class=\"yes\">yes</dd>\n</dl>\n<dl><dt>Adapter</dt>\n"
                          "<dd>Accelerator 4000</dd>\n<dt>Renderer</dt>\n"));
    EXPECT_EQ(Count(page, "<dt>Framebuffers work</dt>"), 1U);
    EXPECT_TRUE(Has(page, "<dt>What happened</dt>\n<dd>The reason &lt;b&gt;.</dd>"));
    EXPECT_FALSE(Has(page, "<dt>Host</dt>"));
    EXPECT_TRUE(Has(page, "<dt>Version of assay</dt>\n<dd>1.0.0</dd>"));
    EXPECT_TRUE(Has(page, "NumGLGPUs=1\n"));
    EXPECT_TRUE(Has(page, "<main><div class=\"devices\">"));
    EXPECT_TRUE(Has(page, "</main>\n<footer>"));
    EXPECT_EQ(page.substr(page.size() - 8), "</html>\n");
}

TEST(ReportPage, OfASeriesHasMediansWithTheLowerBoundOfTheBandwidth)
{
    StoredRun run = CollectBandwidths({"9e+11", "5e+11", "5e+11"});
    run.fOutcome.fLowerBounds = {{"clgpu[0].CLBandwidth", 8e11}};
    std::ostringstream out;
    WriteReportPage(out, run.fReport, run.fOutcome, MakeFacts(), &*run.fSeries);
    EXPECT_TRUE(Has(out.str(), "<dd>500 GB/s (at least 800 GB/s by the host&#39;s clock)</dd>"))
        << out.str();
}

TEST(ReportPage, LoadsNothingAndFitsSmallScreens)
{
    const std::string page = WritePage(Sample(1, 1).GetText(), MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(Has(page, std::string("<!DOCTYPE html>\n<html lang=\"en\"><head>"
                                      "<meta charset=\"utf-8\">\n"
                                      "<meta http-equiv=\"Content-Security-Policy\" "
                                      "content=\"default-src &#39;none&#39;; style-src "
                                      "&#39;unsafe-inline&#39;; "
                                      "script-src &#39;") +
                              std::string(kCopyScriptHash) +
                              "&#39;; base-uri &#39;none&#39;; form-action &#39;none&#39;\">\n"
                              "<meta name=\"viewport\" "
                              "content=\"width=device-width, initial-scale=1\">\n"))
        << page.substr(0, 1000);
}

TEST(ReportPage, EndsWithAButtonThatCopies)
{
    const std::string page = WritePage(Sample(1, 1).GetText(), MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(Has(page, "<footer><p class=\"soft\">Made by assay-host. "
                          "<button id=\"copy\" hidden=\"\">Copy as JSON</button>\n"
                          "<span id=\"copied\" role=\"status\"></span></p>\n</footer>\n"
                          "<script type=\"application/json\" id=\"json\">"))
        << page.substr(page.find("<footer>"), 400);
}

TEST(ReportPage, HasAllPartsOfARun)
{
    const std::string page = WritePage(Sample(1, 1).GetText(), MakeOutcome(Verdict::kComplete));
    for (const char* part :
         {"<h2>The run</h2>", "<dt>Result</dt>\n<dd>", "<dt>What happened</dt>",
          "<dt>Exit status of assay</dt>\n<dd>0</dd>", "<dt>Command</dt>", "<dt>Time</dt>",
          "<dt>Devices</dt>", "<dt>Build</dt>\n<dd>12.8</dd>",
          "<dt>Architecture</dt>\n<dd>x86_64</dd>",
          "<dt>When</dt>\n<dd>2026-11-22T01:26:02Z (local time +01:00)</dd>",
          "<dt>Version of assay-host</dt>\n<dd>1.0.0</dd>", "<h2>Measurements</h2>",
          "<summary>What the terms mean</summary>\n<dl><dt>", "<dt>OpenGL: Shaders compile</dt>",
          "<summary>Report lines (", "<div class=\"devices\"><article"})
        EXPECT_TRUE(Has(page, part)) << part;
    for (const char* part : {"Last report line", "Last log line", "Next line", "Standard error"})
        EXPECT_FALSE(Has(page, part)) << part;
}

TEST(ReportPage, OfACrash)
{
    RunOutcome outcome = MakeOutcome(Verdict::kCrashed);
    outcome.fTermination = "signal 11 (Segmentation fault)";
    outcome.fLastReportLine = "glgpu[0].GLVersion=\"4.1\"";
    outcome.fErrorLines = {"a < b", ""};
    const std::string page =
        WritePage(Sample(1, 1).EndAfter("glgpu[0].GLVersion").GetText(), outcome);
    EXPECT_TRUE(Has(page, "<h1>The reason &lt;b&gt;.</h1>"));
    EXPECT_TRUE(Has(page, "<span class=\"broken\">broken</span> (glgpu[0]): assay crashed"));
    EXPECT_TRUE(Has(page, "<h2>What to do</h2>\n<ul><li>Update the graphics driver"));
    EXPECT_TRUE(Has(page, "<dt>Ended by</dt>\n<dd>signal 11 (Segmentation fault)</dd>"));
    EXPECT_TRUE(
        Has(page, "<dt>Last report line</dt>\n<dd>glgpu[0].GLVersion=&quot;4.1&quot;</dd>"));
    EXPECT_TRUE(Has(page, "<dt>Next line</dt>\n<dd>glgpu[0].IsIntegratedGLGPU</dd>"));
    EXPECT_TRUE(Has(page, "<h3>No answer</h3>\n<dl><dt>run ended before</dt>"));
    EXPECT_TRUE(Has(page, "<summary>Standard error (2)</summary>\n<pre>a &lt; b\n\n</pre>"));
    EXPECT_FALSE(Has(page, "Measurements"));
    EXPECT_FALSE(Has(page, "Trials"));
    EXPECT_FALSE(Has(page, "<summary>Limits"));
    EXPECT_FALSE(Has(page, "<summary>Extensions"));
    EXPECT_FALSE(Has(page, "<dt>Adapter</dt>"));
}

TEST(ReportPage, ACardWithoutFactsHasNoEmptyList)
{
    const std::string page =
        WritePage(Sample(1, 0).EndAfter("NumGLGPUs").GetText(), MakeOutcome(Verdict::kCrashed));
    EXPECT_TRUE(Has(page, "id=\"glgpu[0]\""));
    EXPECT_FALSE(Has(page, "<dl></dl>"));
}

TEST(ReportPage, NamesTheDevicesOfItsBars)
{
    const std::string page = WritePage(Sample(0, 1).GetText(), MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(Has(page, "<th scope=\"row\">clgpu[0] Accelerator 4000</th>"));
    EXPECT_EQ(Count(page, "<h2>Measurements</h2>"), 1U);
    EXPECT_LT(page.find("<h2>Measurements</h2>"), page.find("(more is better)"));
}

TEST(ReportPage, HasABarForASmallMeasurement)
{
    const std::string page = WritePage(
        Sample(0, 1).Set("clgpu[0].CLBandwidth", "0").Set("clgpu[0].CLCompute", "0.5").GetText(),
        MakeOutcome(Verdict::kComplete));
    EXPECT_EQ(Count(page, "class=\"bar\""), 1U);
}

TEST(ReportPage, OfASeriesHasItsMedians)
{
    const StoredRun run = CollectBandwidths({"9e+11", "5e+11", "5.1e+11"});
    std::ostringstream out;
    WriteReportPage(out, run.fReport, run.fOutcome, MakeFacts(), &*run.fSeries);
    const std::string page = out.str();
    EXPECT_TRUE(Has(page, "<h2>Series: 3 runs</h2>"));
    EXPECT_FALSE(Has(page, "<h2>Measurements</h2>"));
    EXPECT_TRUE(Has(page, "<dt>Copy bandwidth</dt>\n<dd>505 GB/s</dd>"));
    EXPECT_TRUE(Has(page, "\"series\""));
}

TEST(ReportPage, SaysWhereItWasMade)
{
    RunFacts facts = MakeFacts();
    facts.fEnvironment.fHost = {"a <host>", ""};
    facts.fEnvironment.fTime = "";
    std::ostringstream out;
    WriteReportPage(out, ReadReport(Sample(0, -1).GetText()), MakeOutcome(Verdict::kComplete),
                    facts);
    const std::string page = out.str();
    EXPECT_TRUE(Has(page, "<dt>Host</dt>\n<dd>a &lt;host&gt;</dd>"));
    EXPECT_FALSE(Has(page, "<dt>When</dt>"));
    EXPECT_TRUE(Has(page, "<dt>OpenCL</dt>\n<dd><span class=\"absent\">absent</span>: There is "
                          "no OpenCL library that can be used.</dd>"));
    EXPECT_FALSE(Has(page, "class=\"devices\""));
    EXPECT_FALSE(Has(page, "What the terms mean"));
}

TEST(ReportPage, ExplainsTheTermsOfItsDevices)
{
    const std::string page = WritePage(Sample(1, -1).GetText(), MakeOutcome(Verdict::kComplete));
    std::size_t terms = 0;
    for (const KnownKey& key : GetKnownKeys()) {
        if (key.fKind != DeviceKind::kOpenGL || key.fGroup == KeyGroup::kExtension)
            continue;
        ++terms;
        EXPECT_TRUE(Has(page, "<dt>OpenGL: " + EscapeMarkup(key.fLabel) + "</dt>\n<dd>" +
                                  EscapeMarkup(GetExplanation(key).fMeaning) + "</dd>"))
            << key.fKey;
    }
    EXPECT_EQ(Count(page, "<dt>OpenGL: "), terms);
    EXPECT_EQ(Count(page, "<dt>OpenCL: "), 0U);
    EXPECT_FALSE(
        Has(WritePage(Sample(0, 1).GetText(), MakeOutcome(Verdict::kComplete)), "<dt>OpenGL: "));
}

TEST(ReportPage, HasTheLastLinesOfARunThatIsNotWhole)
{
    RunOutcome outcome = MakeOutcome(Verdict::kHung);
    outcome.fLastLogLine = "# last <log>";
    const std::string page = WritePage(Sample(1, 0).EndAfter("glgpu[0].GLName").GetText(), outcome);
    EXPECT_TRUE(Has(page, "<dt>Last log line</dt>\n<dd># last &lt;log&gt;</dd>"));
    EXPECT_FALSE(Has(page, "<dt>Last report line</dt>")) << "the outcome has none";
}

TEST(ReportPage, HasCardsOfDevicesWithOddAnswers)
{
    const std::string page = WritePage(
        Sample(2, 0).Set("glgpu[0].GLFrameBufferOK", "2").Fail("glgpu[1]", "GLName").GetText() +
            "glgpu[0].New=\"x\"\n",
        MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(Has(page, "<h3>Trials</h3>\n<dl><dt>Shaders compile</dt>\n<dd class=\"yes\">yes"));
    EXPECT_TRUE(Has(page, "<dt>Framebuffers work</dt>\n<dd class=\"unknown\">2</dd>"));
    EXPECT_TRUE(Has(page, "<summary>Others (1)</summary>\n<dl><dt>New</dt>\n<dd>x</dd>"));
    EXPECT_TRUE(Has(page, "<h2>OpenGL device glgpu[1]</h2>"));
    EXPECT_EQ(Count(page, "<summary>Limits"), 1U);
    EXPECT_EQ(Count(page, "<h3>Trials</h3>"), 1U);
    // A trial isn't among the facts.
    EXPECT_EQ(Count(page, "<dt>Shaders compile</dt>"), 1U);
}

TEST(ReportPage, FailedTrialsStandOut)
{
    const std::string page =
        WritePage(Sample(1, 0).Set("glgpu[0].CanCompileProgramGLSL", "0").GetText(),
                  MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(Has(page, "<h1>OpenGL does not work: glgpu[0]: a realistic pair of shaders"));
    EXPECT_TRUE(Has(page, "<dt>Shaders compile</dt>\n<dd class=\"no\">no</dd>"));
    EXPECT_TRUE(Has(page, "<dt>Framebuffers work</dt>\n<dd class=\"yes\">yes</dd>"));
    EXPECT_TRUE(Has(page, "<h2>Warnings</h2>\n<ul><li>glgpu[0]: a realistic pair"));
}

TEST(ReportPage, AMeasurementThatIsNotKnownHasNoBar)
{
    const std::string page = WritePage(Sample(0, 3)
                                           .Set("clgpu[0].CLBandwidth", "0")
                                           .Set("clgpu[1].CLBandwidth", "1e30")
                                           .Set("clgpu[2].CLBandwidth", "2e11")
                                           .Set("clgpu[0].CLCompute", "0")
                                           .Set("clgpu[1].CLCompute", "0")
                                           .Set("clgpu[2].CLCompute", "0")
                                           .GetText(),
                                       MakeOutcome(Verdict::kComplete));
    EXPECT_EQ(Count(page, "class=\"bar\""), 1U);
    EXPECT_TRUE(Has(page, "<td>200 GB/s</td>"));
    EXPECT_FALSE(Has(page, "Compute score (more"));
}

// Texts of a driver that could do harm in a page, in each place.
TEST(ReportPage, ADriversTextsDoNothing)
{
    const std::string hostile = "</script></style><script>alert(1)</script><!--\"'&\x1B[31m\u202E";
    Sample sample(1, 1);
    for (const SampleValue& value : kSampleGL)
        sample.Set(std::string("glgpu[0].") + value.fKey, "\"" + hostile + "\"");
    for (const SampleValue& value : kSampleCL)
        sample.Set(std::string("clgpu[0].") + value.fKey, "\"" + hostile + "\"");
    RunOutcome outcome = MakeOutcome(Verdict::kCrashed);
    for (std::string* text :
         {&outcome.fReason, &outcome.fTermination, &outcome.fLastReportLine, &outcome.fLastLogLine})
        *text = hostile;
    outcome.fCommand = {hostile};
    outcome.fErrorLines = {hostile};
    outcome.fCauses = {{"OGLContextCreated", hostile}};
    const std::string page =
        WritePage("OGLContextCreated=0\n" + sample.GetText() + hostile + "\n", outcome);
    EXPECT_EQ(Count(page, "<script"), 2U);
    EXPECT_EQ(Count(page, "</script"), 2U);
    EXPECT_EQ(Count(page, "</style"), 1U);
    EXPECT_EQ(Count(page, "<!--"), 0U);
    EXPECT_EQ(Count(page, "\x1B"), 0U);
    // The document has it as it is; a browser shows no part of that.
    const std::size_t document = page.find("<script type=\"application/json\"");
    ASSERT_NE(document, std::string::npos);
    EXPECT_EQ(Count(page.substr(0, document), "\u202E"), 0U);
    EXPECT_GT(Count(page.substr(0, document), "\\x1B[31m\\u{202E}"), 20U);
}

TEST(ReportPage, HoldsTheDocument)
{
    const std::string text = Sample(1, 1).Set("glgpu[0].GLRenderer", "\"</script>\"").GetText();
    const RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    const std::string page = WritePage(text, outcome);
    const std::string begin = "<script type=\"application/json\" id=\"json\">";
    const std::size_t start = page.find(begin) + begin.size();
    std::string json = page.substr(start, page.find("</script>", start) - start);
    const std::string escape = "\\u003C";
    EXPECT_EQ(Count(json, "<"), 0U);
    ASSERT_GT(Count(json, escape), 0U);
    for (std::size_t at = json.find(escape); at != std::string::npos; at = json.find(escape, at))
        json.replace(at, escape.size(), "<");
    std::ostringstream document;
    WriteDocument(document, ReadReport(text), outcome, MakeFacts());
    EXPECT_EQ(json, document.str());
}

TEST(ReportPage, AllowsOnlyItsOwnScript)
{
    const std::string page = WritePage(Sample(0, 0).GetText(), MakeOutcome(Verdict::kComplete));
    EXPECT_TRUE(
        Has(page, "content=\"default-src &#39;none&#39;; style-src &#39;unsafe-inline&#39;; "
                  "script-src &#39;" +
                      std::string(kCopyScriptHash) + "&#39;;"));
    EXPECT_TRUE(Has(page, "<script>" + std::string(kCopyScript) + "</script>"));
    for (const char* const remote : {"http:", "https:", "url(", "src=", "@import", "href="})
        EXPECT_EQ(Count(page, remote), 0U) << remote;
}

} // namespace
} // namespace assay_host
