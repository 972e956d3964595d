#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <utility>

#include "html/DiffPage.h"
#include "report/DiffJson.h"
#include "report/Lines.h"
#include "report/Samples.h"

namespace assay_host {
namespace {

StoredRun MakeRun(Sample sample)
{
    StoredRun run;
    run.fReport = ReadReport(sample.GetText());
    run.fOutcome.fVerdict = Verdict::kComplete;
    run.fFacts.fEnvironment.fTime = "2026-11-22T01:26:02Z";
    run.fFacts.fEnvironment.fHost = {"", "only with --identify"};
    run.fFacts.fEnvironment.fSystem = {"Example <OS>", ""};
    return run;
}

std::string WritePage(const ComparedRuns& runs)
{
    std::ostringstream out;
    WriteDiffPage(out, runs, "1.0.0");
    return out.str();
}

std::string WritePage(Sample before, Sample after)
{
    ComparisonOptions options;
    options.fKeepSame = true;
    ComparedRuns runs("a<b>.json", MakeRun(before));
    runs.Add("b\x1B.json", MakeRun(after), options);
    return WritePage(runs);
}

bool Has(const std::string& page, const std::string& part)
{
    return page.find(part) != std::string::npos;
}

TEST(DiffPage, LeadsWithWhatDiffers)
{
    const std::string page = WritePage(Sample(1, 1), Sample(1, 1)
                                                         .Set("glgpu[0].CanCompileProgramGLSL", "0")
                                                         .Set("glgpu[0].GLMemoryMB", "1024")
                                                         .Set("clgpu[0].CUDAVersion", "")
                                                         .Set("clgpu[0].CLCompute", "600"));
    EXPECT_EQ(page.substr(0, 16), "<!DOCTYPE html>\n");
    EXPECT_TRUE(Has(page, "<h1>OpenGL: hardware in the first report, broken in the second.</h1>"));
    EXPECT_TRUE(Has(page, "<dd>a&lt;b&gt;.json: complete, 2026-11-22T01:26:02Z, Example "
                          "&lt;OS&gt;</dd>"));
    EXPECT_TRUE(Has(page, "<dd>b\\x1B.json: complete"));
    EXPECT_TRUE(Has(page, "<h2>What to do</h2>"));
    EXPECT_TRUE(Has(page, "<span class=\"hardware\">hardware (glgpu[0]): OpenGL works"));
    EXPECT_TRUE(Has(page, "<span class=\"broken\">broken (glgpu[0]): OpenGL does not work"));
    EXPECT_TRUE(Has(page, "Shaders compile <span class=\"soft\">glgpu[0]</span></th>\n"
                          "<td><span class=\"yes\">yes</span></td>\n"
                          "<td><span class=\"no\">no</span></td>"));
    EXPECT_TRUE(Has(page, "<td><span class=\"value\">23.99 GiB</span></td>\n"
                          "<td><span class=\"value\">1 GiB</span></td>"));
    EXPECT_TRUE(Has(page, "<span class=\"soft\">not printed by this device</span>"));
    EXPECT_TRUE(Has(page, " (-51.4 %)</td>"));
    EXPECT_TRUE(Has(page, "<caption>clgpu[0] Compute score (more is better)</caption>"));
    EXPECT_TRUE(Has(page, "<main><h2>"));
    EXPECT_TRUE(Has(page, "</main>\n<footer>"));
    // 56 lines without two stamps, and four differences.
    EXPECT_TRUE(Has(page, "<summary>The same in both reports (50)</summary>"));
    EXPECT_FALSE(Has(page, "<h3>What can be used"));
    EXPECT_TRUE(Has(page, "<header><h1>"));
    EXPECT_TRUE(Has(page, "</header>\n<main>"));
    EXPECT_TRUE(Has(page, "<dt>glgpu[0] Vendor</dt>\n<dd>Example Corporation</dd>"));
    EXPECT_TRUE(Has(page, "<dt>Tester</dt>\n<dd>Pixmere</dd>"));
    EXPECT_LT(page.find("<h2>What can be used"), page.find("<h2>Trials"));
    EXPECT_LT(page.find("<h2>Trials"), page.find("<h2>Facts"));
    EXPECT_LT(page.find("<h2>Facts"), page.find("<h2>Measurements"));
}

TEST(DiffPage, AMeasurementThatIsNotKnownHasNoBar)
{
    EXPECT_FALSE(Has(WritePage(Sample(0, 1), Sample(0, 1).Set("clgpu[0].CLBandwidth", "0")),
                     "class=\"bar\""));
    EXPECT_FALSE(Has(WritePage(Sample(0, 1).Set("clgpu[0].CLBandwidth", "1e30"), Sample(0, 1)),
                     "class=\"bar\""));
    EXPECT_TRUE(Has(WritePage(Sample(0, 1).Set("clgpu[0].CLBandwidth", "1e9"), Sample(0, 1)),
                    "class=\"bar\""));
}

TEST(DiffPage, ASmallMeasurementHasABar)
{
    EXPECT_TRUE(Has(WritePage(Sample(0, 1).Set("clgpu[0].CLCompute", "0.5"),
                              Sample(0, 1).Set("clgpu[0].CLCompute", "0.25")),
                    "class=\"bar\""));
}

TEST(DiffPage, ShowsMeasurementsThatAreAboutTheSame)
{
    EXPECT_TRUE(Has(WritePage(Sample(0, 1).Set("clgpu[0].CLBandwidth", "1e9"),
                              Sample(0, 1).Set("clgpu[0].CLBandwidth", "1.01e9")),
                    "<dt>clgpu[0] Copy bandwidth</dt>\n<dd>1 GB/s, 1.01 GB/s</dd>"));
}

TEST(DiffPage, OfSeveralReports)
{
    ComparedRuns runs("a.json", MakeRun(Sample(1, 0)));
    runs.Add("b.json", MakeRun(Sample(1, 0)), {});
    runs.Add("c.json", MakeRun(Sample(1, 0).Set("glgpu[0].GLMemoryMB", "1")), {});
    const std::string page = WritePage(runs);
    EXPECT_TRUE(Has(page, "<h1>1 of 2 reports differs from the first one.</h1>\n<dl>"));
    EXPECT_TRUE(Has(page, "<title>assay: 1 of 2 reports differs from the first one.</title>"));
    EXPECT_TRUE(Has(page, "<p class=\"soft\">c.json: complete, 2026-11-22T01:26:02Z, Example "));
    EXPECT_FALSE(Has(page, "What to do"));
    EXPECT_TRUE(Has(page, "<h2>b.json</h2>"));
    EXPECT_TRUE(Has(page, "<p>The reports do not differ.</p>"));
    EXPECT_TRUE(Has(page, "<h2>c.json</h2>"));
    EXPECT_TRUE(Has(page, "<p>1 fact differs.</p>\n<h3>Facts</h3>"));
    EXPECT_FALSE(Has(page, "Second report</dt>"));
}

TEST(DiffPage, CountsTheReportsThatDiffer)
{
    ComparedRuns same("a.json", MakeRun(Sample(1, 0)));
    ComparedRuns other("a.json", MakeRun(Sample(1, 0)));
    for (int count = 0; count < 2; ++count) {
        same.Add("b.json", MakeRun(Sample(1, 0)), {});
        other.Add("b.json", MakeRun(Sample(1, 0).Set("glgpu[0].GLFrameBufferOK", "0")), {});
    }
    EXPECT_TRUE(Has(WritePage(same), "<h1>0 of 2 reports differ from the first one.</h1>"));
    const std::string page = WritePage(other);
    EXPECT_TRUE(Has(page, "<h1>2 of 2 reports differ from the first one.</h1>"));
    EXPECT_TRUE(Has(page, "<h3>What to do</h3>\n<ul><li>"));
}

TEST(DiffPage, SaysOfARunWhatIsKnown)
{
    StoredRun bare = MakeRun(Sample(1, 0));
    bare.fExtent = OutcomeExtent::kNone;
    bare.fFacts = {};
    StoredRun full = MakeRun(Sample(1, 0));
    full.fFacts.fEnvironment.fHost = {"a <host>", ""};
    ComparedRuns runs("a.txt", std::move(bare));
    runs.Add("b.json", std::move(full), {});
    const std::string page = WritePage(runs);
    EXPECT_TRUE(Has(page, "<dl><dt>First report</dt>\n<dd>a.txt</dd>\n"
                          "<dt>Second report</dt>\n<dd>b.json: complete, 2026-11-22T01:26:02Z, "
                          "a &lt;host&gt;, Example &lt;OS&gt;</dd>\n</dl>\n"))
        << page.substr(page.find("<header>"), 400);
}

TEST(DiffPage, HoldsTheDocument)
{
    ComparedRuns runs("a.json", MakeRun(Sample(1, 0)));
    runs.Add("b.json", MakeRun(Sample(1, 0).Set("glgpu[0].GLMemoryMB", "1")), {});
    std::ostringstream document;
    WriteDiffDocument(document, runs, "1.0.0");
    std::string json = document.str();
    for (std::size_t at = json.find('<'); at != std::string::npos; at = json.find('<', at))
        json.replace(at, 1, "\\u003C");
    EXPECT_TRUE(Has(WritePage(runs), "id=\"json\">" + json + "</script>"));
}

TEST(DiffPage, DrawsMeasurementsThatDiffer)
{
    const std::string page =
        WritePage(Sample(0, 1).Set("clgpu[0].CLBandwidth", "1e9"),
                  Sample(0, 1).Set("clgpu[0].CLBandwidth", "2e9").Set("clgpu[0].CLName", "\"B\""));
    EXPECT_TRUE(Has(page, "<caption>clgpu[0] Copy bandwidth (more is better)</caption>\n<tbody><tr>"
                          "<th scope=\"row\">First report</th>"));
    EXPECT_TRUE(Has(page, "<th scope=\"row\">Second report</th>"));
    EXPECT_TRUE(Has(page, "<td>1 GB/s</td>"));
}

} // namespace
} // namespace assay_host
