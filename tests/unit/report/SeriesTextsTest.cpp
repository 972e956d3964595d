// The texts about a series and its findings.
#include "series/SeriesTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "SeriesSamples.h"
#include "series/Findings.h"
#include "series/SeriesView.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::Pair;

Series MakeSeries(std::size_t runs)
{
    Series series;
    series.fRuns = runs;
    series.fVerdicts = {{Verdict::kComplete, runs}};
    series.fSeconds = 0.256;
    return series;
}

TEST(SeriesTexts, TellOfOneRun)
{
    Series series = MakeSeries(1);
    series.fPlan.fRuns = 1;
    EXPECT_EQ(GetSeriesTitle(series), "Series: 1 run");
    EXPECT_THAT(GetSeriesRows(series),
                ElementsAre(Pair("Verdicts", "1 complete"), Pair("Time", "0.26 s"),
                            Pair("Facts above", "of run 1; measurements are medians")));
}

TEST(SeriesTexts, TellWhyASeriesEnded)
{
    const std::pair<SeriesEnd, const char*> rows[] = {
        {SeriesEnd::kInterrupted, "it was interrupted before its end"},
        {SeriesEnd::kGivenUp, "each further run would have ended the same way"},
        {SeriesEnd::kFull, "it has as many samples as a document can have"}};
    for (const auto& [end, text] : rows) {
        Series series = MakeSeries(2);
        series.fPlan.fRuns = 3;
        series.fEnd = end;
        EXPECT_THAT(GetSeriesRows(series),
                    ElementsAre(Pair("Verdicts", "2 complete"), Pair("Asked for", "3 runs"),
                                Pair("Ended early", text), Pair("Time", "0.26 s"),
                                Pair("Facts above", "of run 1; measurements are medians")));
    }
}

TEST(SeriesTexts, NameTheDeviceOnce)
{
    const auto text = [](const char* tag, const char* sentence) {
        SeriesFinding finding;
        finding.fTag = tag;
        finding.fText = sentence;
        return GetFindingText(finding);
    };
    EXPECT_EQ(text("", "x differed"), "x differed");
    EXPECT_EQ(text("clgpu[0]", "x differed"), "clgpu[0]: x differed");
    EXPECT_EQ(text("clgpu[0]", "clgpu[0] was missing"), "clgpu[0] was missing");
    EXPECT_EQ(text("clgpu[0]", "the place of clgpu[0]"), "clgpu[0]: the place of clgpu[0]");
}

TEST(SeriesTexts, HaveTheStatisticsOfTheTime)
{
    Measurement time;
    time.fSamples = {{1, 3}, {2, 1.23456}, {3, 0, "why \x1B"}, {5, 0, "why \x1B"}};
    EXPECT_EQ(GetMeasurementTitle(time), "Time of a run");
    EXPECT_THAT(GetStatisticsRows(time, GetStatistics(time)),
                ElementsAre(Pair("Median", "1.235 s (1 run)"),
                            Pair("Quartiles", "1.235 s to 1.235 s"), Pair("Minimum", "1.235 s"),
                            Pair("Maximum", "1.235 s"),
                            Pair("Spread", "0.0 % of the median between the quartiles"),
                            Pair("First run", "3 s"), Pair("Not known", "runs 3, 5: why \\x1B")));
}

TEST(SeriesTexts, NameTenOutliers)
{
    SeriesStatistics statistics;
    std::string text;
    for (std::size_t run = 1; run <= 10; ++run) {
        statistics.fOutliers.push_back({run, 0.5});
        text += (run == 1 ? "" : ", ") + ("0.5 s in run " + std::to_string(run));
    }
    EXPECT_THAT(GetStatisticsRows({}, statistics), ElementsAre(Pair("Outliers", text)));
    statistics.fOutliers.push_back({11, 0.5});
    EXPECT_THAT(GetStatisticsRows({}, statistics),
                ElementsAre(Pair("Outliers", text + " and 1 more")));
}

RunList MakeRuns(const std::vector<std::size_t>& runs)
{
    RunList list;
    for (const std::size_t run : runs)
        list.Add(run);
    return list;
}

TEST(RunList, NamesTheFirstFiveRuns)
{
    EXPECT_EQ(MakeRuns({7}).GetText(), "run 7");
    EXPECT_EQ(MakeRuns({1, 2, 3, 4, 5}).GetText(), "runs 1, 2, 3, 4, 5");
    EXPECT_EQ(MakeRuns({1, 2, 3, 4, 5, 6}).GetText(), "runs 1, 2, 3, 4, 5 and 1 more");
    RunList both = MakeRuns({3, 6});
    both.Add(MakeRuns({1, 4}));
    EXPECT_EQ(both.GetText(), "runs 1, 3, 4, 6");
    EXPECT_EQ(both.GetCount(), 4U);
}

TEST(RunList, KeepsTwentyRuns)
{
    RunList runs;
    for (std::size_t run = 21; run <= 41; ++run)
        runs.Add(run);
    EXPECT_EQ(runs.GetCount(), 21U);
    EXPECT_EQ(runs.GetNamed().size(), 20U);
    runs.Add(MakeRuns({1}));
    EXPECT_EQ(runs.GetCount(), 22U);
    ASSERT_EQ(runs.GetNamed().size(), 20U);
    EXPECT_EQ(runs.GetNamed().front(), 1U);
    EXPECT_EQ(runs.GetNamed().back(), 39U);
}

std::string GetFactText(const std::vector<std::string>& values)
{
    FactLog log;
    for (std::size_t run = 1; run <= values.size(); ++run)
        log.Add(run, 0, "name", values[run - 1]);
    return MakeFactFinding(log.GetChanged().at(0), nullptr).fText;
}

TEST(Findings, ShortenLongValues)
{
    const std::string x60(60, 'x');
    EXPECT_EQ(GetFactText({x60, x60 + "y"}),
              "name differed in 1 of 2 runs: " + x60 + " (run 1), " + x60 + "... (run 2)");
    const std::string x59(59, 'x');
    EXPECT_EQ(GetFactText({"a", x59 + "\xC3\xA9z"}),
              "name differed in 1 of 2 runs: a (run 1), " + x59 + "... (run 2)");
    EXPECT_EQ(GetFactText({"a", std::string(61, '\x80')}),
              "name differed in 1 of 2 runs: a (run 1), ... (run 2)");
}

TEST(Findings, NameFourValuesAndFewRuns)
{
    EXPECT_EQ(GetFactText({"a", "b", "c", "d"}),
              "name differed in 3 of 4 runs: a (run 1), b (run 2), c (run 3), d (run 4)");
    EXPECT_EQ(GetFactText({"a", "b", "c", "d", "e"}),
              "name differed in 4 of 5 runs: a (run 1), b (run 2), c (run 3), d (run 4) and "
              "others");
    EXPECT_EQ(GetFactText({"a", "a", "a", "a", "a", "b"}),
              "name differed in 1 of 6 runs: a (runs 1, 2, 3, 4, 5), b (run 6)");
    EXPECT_EQ(GetFactText({"a", "a", "a", "a", "a", "a", "b"}),
              "name differed in 1 of 7 runs: a (6 runs), b (run 7)");
    const ChangedFact fact = {0, "name", {{"a", MakeRuns({1})}}, MakeRuns({2}), MakeRuns({2}), 2};
    EXPECT_EQ(MakeFactFinding(fact, nullptr).fText,
              "name differed in 1 of 2 runs: a (run 1) and others");
}

TEST(Findings, AreSentences)
{
    const ChangedFact fact = {0,  "x",           {{"a", MakeRuns({1})}, {"b", MakeRuns({2})}},
                              {}, MakeRuns({2}), 2};
    const KnownDevice plain = {DeviceKind::kOpenCL, "clgpu[1]", ""};
    const KnownDevice named = {DeviceKind::kOpenCL, "clgpu[1]", "B"};
    Measurement measurement;
    measurement.fTag = "clgpu[1]";
    EXPECT_THAT(
        GetTexts({MakeVerdictFinding(Verdict::kCrashed, "", MakeRuns({2}), 3),
                  MakeVerdictFinding(Verdict::kCrashed, "It \x1B.", MakeRuns({2}), 3),
                  MakeFactFinding(fact, &plain), MakeTagFinding(fact, plain),
                  MakeTagFinding(fact, named), MakeUsableFinding(fact, DeviceKind::kOpenGL),
                  MakeAbsenceFinding(named, MakeRuns({2, 3}), 4),
                  MakeUnknownFinding(measurement, "no clock", MakeRuns({2}), 4)}),
        ElementsAre("verdict: : crashed in 1 of 3 runs (run 2)",
                    "verdict: : crashed in 1 of 3 runs (run 2): It \\x1B.",
                    "fact-changed: clgpu[1]: x differed in 1 of 2 runs: a (run 1), b (run 2)",
                    "device-moved: clgpu[1]: the place of clgpu[1] differed in 1 of 2 runs: a "
                    "(run 1), b (run 2)",
                    "device-moved: clgpu[1]: the place of clgpu[1] \"B\" differed in 1 of 2 runs: "
                    "a (run 1), b (run 2)",
                    "usable-changed: : the answer for OpenGL differed in 1 of 2 runs: a (run 1), b "
                    "(run 2)",
                    "device-absent: clgpu[1]: clgpu[1] \"B\" was missing in 2 of 4 runs (runs 2, "
                    "3)",
                    "not-measured: clgpu[1]: seconds is not known in 1 of 4 runs (run 2): no "
                    "clock"));
}

TEST(SeriesView, ItsPlotsAreAsWideAsTheTextAllows)
{
    const Series series = *CollectBandwidths({"1e+11", "1e+11", "2e+11"}).fSeries;
    const std::pair<int, std::size_t> rows[] = {{-1, 40}, {0, 40},  {40, 40}, {41, 41},
                                                {73, 73}, {74, 74}, {75, 74}, {200, 74}};
    for (const auto& [width, columns] : rows) {
        std::ostringstream out;
        PrintSeries(out, series, width);
        std::istringstream text(out.str());
        std::string plot;
        for (std::string line; plot.empty() && std::getline(text, line);)
            if (line.rfind("  |", 0) == 0)
                plot = line;
        EXPECT_EQ(plot.size(), columns) << width;
    }
}

} // namespace
} // namespace assay_host
