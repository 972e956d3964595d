#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "html/SeriesSection.h"

namespace assay_host {
namespace {

Series MakeSeries()
{
    Series series;
    series.fPlan.fRuns = series.fRuns = 3;
    series.fSeconds = 1.5;
    series.fVerdicts = {{Verdict::kComplete, 3}};
    return series;
}

Measurement MakeTimes(double first)
{
    Measurement times;
    times.fSamples = {{1, first}, {2, 0.25}, {3, 0.75}};
    return times;
}

std::string Write(const Series& series)
{
    std::ostringstream out;
    Markup page(out);
    AddSeriesSection(page, series);
    return out.str();
}

bool Has(const std::string& page, const std::string& part)
{
    return page.find(part) != std::string::npos;
}

const std::string kHead = "<h2>Series: 3 runs</h2>\n"
                          "<dl><dt>Verdicts</dt>\n<dd>3 complete</dd>\n"
                          "<dt>Time</dt>\n<dd>1.50 s</dd>\n"
                          "<dt>Facts above</dt>\n<dd>of run 1; measurements are medians</dd>\n"
                          "</dl>\n";
const std::string kEnd =
    "<p class=\"soft\">A box has the quartiles and the median of all runs but the first. Its lines "
    "end at the farthest samples that are no outliers. Full dots are runs, hollow ones are "
    "outliers, and the diamond is the first run.</p>\n";

TEST(SeriesSection, SaysHowTheSeriesWent)
{
    EXPECT_EQ(Write(MakeSeries()), kHead + kEnd);
}

TEST(SeriesSection, ListsWhatChanged)
{
    Series series = MakeSeries();
    series.fFindings = {{"fact", "clgpu[0]", "A <fact> changed.", 1, {2}},
                        {"verdict", "", "The verdict changed.", 1, {3}}};
    EXPECT_EQ(Write(series), kHead +
                                 "<h3>What changed between the runs</h3>\n"
                                 "<ul><li>clgpu[0]: A &lt;fact&gt; changed.</li>\n"
                                 "<li>The verdict changed.</li>\n</ul>\n" +
                                 kEnd);
}

TEST(SeriesSection, DrawsEachMeasurement)
{
    Series series = MakeSeries();
    series.fMeasurements = {MakeTimes(0.5)};
    const std::string page = Write(series);
    const std::string begin =
        kHead +
        "<h3>Time of a run</h3>\n"
        "<svg class=\"plot\" viewBox=\"0 0 600 48\" role=\"img\" "
        "aria-labelledby=\"plot-1 plot-1-text\">"
        "<title id=\"plot-1\">Box plot: Time of a run</title>\n"
        "<desc id=\"plot-1-text\">Median: 0.5 s (2 runs); Quartiles: 0.375 s to 0.625 s; "
        "Minimum: 0.25 s; Maximum: 0.75 s; Spread: 50.0 % of the median between the quartiles; "
        "First run: 0.5 s</desc>\n";
    EXPECT_EQ(page.substr(0, begin.size()), begin);
    const std::string rest =
        "</svg>\n<div class=\"scale\"><span>0.25 s</span><span>0.75 s</span></div>\n"
        "<dl><dt>Median</dt>\n<dd>0.5 s (2 runs)</dd>\n"
        "<dt>Quartiles</dt>\n<dd>0.375 s to 0.625 s</dd>\n"
        "<dt>Minimum</dt>\n<dd>0.25 s</dd>\n<dt>Maximum</dt>\n<dd>0.75 s</dd>\n"
        "<dt>Spread</dt>\n<dd>50.0 % of the median between the quartiles</dd>\n"
        "<dt>First run</dt>\n<dd>0.5 s</dd>\n</dl>\n" +
        kEnd;
    EXPECT_EQ(page.substr(page.find("</svg>")), rest);
    EXPECT_TRUE(Has(page, "<circle class=\"dot\" cx=\"8.0\""));
    EXPECT_TRUE(Has(page, "<path class=\"first\" d=\"M294.0 "));
}

TEST(SeriesSection, ItsScaleHasTheFirstRunToo)
{
    Series series = MakeSeries();
    series.fMeasurements = {MakeTimes(0.125), MakeTimes(2)};
    const std::string page = Write(series);
    EXPECT_TRUE(Has(page, "<span>0.125 s</span><span>0.75 s</span>"));
    EXPECT_TRUE(Has(page, "<span>0.25 s</span><span>2 s</span>"));
    EXPECT_TRUE(Has(page, "<title id=\"plot-1\">"));
    EXPECT_TRUE(Has(page, "<title id=\"plot-2\">"));
}

TEST(SeriesSection, DrawsNothingWithoutALaterRun)
{
    Series series = MakeSeries();
    Measurement times;
    times.fSamples = {{1, 0.5}};
    series.fMeasurements = {times};
    EXPECT_EQ(Write(series), kHead +
                                 "<h3>Time of a run</h3>\n"
                                 "<dl><dt>First run</dt>\n<dd>0.5 s</dd>\n</dl>\n" +
                                 kEnd);
}

} // namespace
} // namespace assay_host
