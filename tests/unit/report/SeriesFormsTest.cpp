#include <gtest/gtest.h>

#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "SavedJson.h"
#include "SeriesSamples.h"
#include "series/MedianReport.h"
#include "series/SeriesStatistics.h"
#include "series/SeriesView.h"
#include "series/TextPlot.h"

namespace assay_host {
namespace {

RunFacts MakeFacts()
{
    const Fact unknown = {"", "not asked for"};
    RunFacts facts;
    facts.fHostVersion = "1.2.3";
    facts.fChildVersion = unknown;
    facts.fEnvironment = {unknown, unknown, unknown, unknown, unknown, "2026-11-22T01:26:02Z",
                          "+01:00"};
    return facts;
}

std::string GetSeriesDocument(const StoredRun& run)
{
    std::ostringstream out;
    WriteDocument(out, run.fReport, run.fOutcome, MakeFacts(),
                  run.fSeries ? &*run.fSeries : nullptr);
    return out.str();
}

StoredRun ReadRun(const std::string& text)
{
    std::istringstream in(text);
    return ReadDocumentRun(in);
}

// A series with everything that a document can have of one.
StoredRun MakeRichSeries()
{
    SeriesPlan plan;
    plan.fRuns = 20;
    plan.fSeconds = 2.5;
    SeriesCollector series(plan);
    const char* const bandwidths[] = {"9e+11", "5e+11",   "5.1e+11", "4.9e+11",
                                      "5e+11", "5.2e+11", "0",       "1e+11"};
    for (const char* const bandwidth : bandwidths)
        AddRun(series, Sample(1, 1)
                           .Set("clgpu[0].CLBandwidth", bandwidth)
                           .Set("clgpu[0].CLName", "\"A \xFF <b>\"")
                           .Set("glgpu[0].GLMemoryMB", bandwidth[0] == '1' ? "1" : "2"));
    series.Add(ReadReport(Sample(1, 1).EndAfter("clgpu[0].CLName").GetText()),
               MakeSeriesOutcome(Verdict::kCrashed, "It \xFE crashed."));
    return series.Finish(SeriesEnd::kInterrupted, 4.5);
}

TEST(JsonSeries, HasTheStatisticsOfTheSamples)
{
    const Json series = SaveDocument(Json::parse(GetSeriesDocument(MakeRichSeries())))["series"];
    EXPECT_EQ(series["repeat"], 20);
    EXPECT_EQ(series["forSeconds"], 2.5);
    EXPECT_EQ(series["end"], "interrupted");
    EXPECT_EQ(series["runs"], 9);
    EXPECT_EQ(series["shown"], 9);
    EXPECT_EQ(series["verdicts"], Json::parse(R"([{"verdict": "complete", "runs": 8},
                                                  {"verdict": "crashed", "runs": 1}])"));
    const Json& measurement = series["measurements"][0];
    EXPECT_EQ(measurement["key"], "CLBandwidth");
    EXPECT_EQ(measurement["unit"], "bytes per second");
    EXPECT_EQ(measurement["first"], 9e11);
    EXPECT_EQ(measurement["samples"].size(), 9U);
    EXPECT_EQ(measurement["samples"][6], Json::parse(R"({"run": 7, "known": false, "value": "0",
                              "reason": "the device's clock reported no elapsed time"})"));
    const Json& statistics = measurement["statistics"];
    EXPECT_EQ(statistics["count"], 6);
    EXPECT_EQ(statistics["minimum"], 1e11);
    EXPECT_EQ(statistics["median"], 5e11);
    EXPECT_EQ(statistics["lowerQuartile"], 4.925e11);
    EXPECT_EQ(statistics["upperQuartile"], 5.075e11);
    EXPECT_EQ(statistics["spread"], 1.5e10);
    EXPECT_EQ(statistics["outliers"], Json::parse(R"([{"run": 8, "number": 1e11}])"));
    EXPECT_EQ(series["measurements"][2]["key"], "seconds");
    EXPECT_EQ(series["findings"][0]["code"], "verdict");
}

// A reader of the document alone must know what its numbers are.
TEST(JsonSeries, SaysWhatItsNumbersAre)
{
    const Json series =
        SaveDocument(Json::parse(GetSeriesDocument(CollectBandwidths({"5e+11"}))))["series"];
    EXPECT_EQ(series["definitions"], Json::parse(R"({
        "samples": "one for each run that has the device; run 1 is the first",
        "statistics": "of the known samples of run 2 and later; no sample is left out",
        "quantiles": "linear interpolation between the samples around the place (count - 1) * fraction: type 7 of Hyndman and Fan",
        "spread": "upperQuartile - lowerQuartile",
        "relativeSpread": "spread / median; 0 if the median is 0",
        "fences": "1.5 * spread below lowerQuartile and above upperQuartile",
        "outliers": "samples beyond the fences"})"));
}

TEST(JsonSeries, ASampleWithoutAReasonStaysUnknown)
{
    Json document = Json::parse(GetSeriesDocument(MakeRichSeries()));
    document["series"]["measurements"][0]["samples"][6]["reason"] = "";
    EXPECT_EQ(ReadRun(document.dump()).fSeries->fMeasurements[0].fSamples[6].fReason,
              "no reason is given");
}

TEST(JsonSeries, OfOneRunHasNoStatistics)
{
    const Json series =
        SaveDocument(Json::parse(GetSeriesDocument(CollectBandwidths({"0"}))))["series"];
    EXPECT_EQ(series["repeat"], 1);
    EXPECT_EQ(series["forSeconds"], nullptr);
    EXPECT_EQ(series["measurements"][0]["first"], nullptr);
    EXPECT_EQ(series["measurements"][0]["statistics"], Json::parse(R"({"known": false,
                              "reason": "no run after the first has a known sample"})"));
}

TEST(JsonSeries, ComesBack)
{
    SeriesPlan half;
    half.fSeconds = 0.5;
    SeriesCollector timed(half);
    AddRun(timed, Sample(0, 1));
    const StoredRun shortest = timed.Finish(SeriesEnd::kDone, 0.75);
    EXPECT_EQ(Json::parse(GetSeriesDocument(shortest))["series"]["repeat"], nullptr);
    EXPECT_EQ(Json::parse(GetSeriesDocument(shortest))["series"]["forSeconds"], 0.5);
    for (const StoredRun& run :
         {MakeRichSeries(), CollectBandwidths({"5e+11", "0", "4e+11"}), shortest}) {
        const std::string text = GetSeriesDocument(run);
        const StoredRun read = ReadRun(text);
        ASSERT_TRUE(read.fSeries);
        EXPECT_EQ(GetSeriesDocument(read), text);
    }
}

TEST(JsonSeries, ADocumentWithoutOneHasNone)
{
    StoredRun run = CollectBandwidths({"5e+11"});
    run.fSeries.reset();
    EXPECT_FALSE(ReadRun(GetSeriesDocument(run)).fSeries);
}

TEST(JsonSeries, NamesTheFirstError)
{
    const Json whole = Json::parse(GetSeriesDocument(MakeRichSeries()));
    const auto expect = [&](auto change, const char* text) {
        Json document = whole;
        change(document["series"]);
        try {
            ReadRun(document.dump());
            ADD_FAILURE() << text;
        } catch (const std::runtime_error& failure) {
            EXPECT_STREQ(failure.what(), text);
        }
    };
    expect([](Json& series) { series = 3; }, "series is not an object");
    expect([](Json& series) { series.erase("runs"); }, "series: \"runs\" is missing");
    expect([](Json& series) { series["end"] = "x\n"; },
           "series: \"end\" is \"x\\n\", which is none");
    expect([](Json& series) { series["measurements"][1]["key"] = "CLName"; },
           "series.measurements[1]: \"key\" is no measurement");
    expect([](Json& series) { series["measurements"][1]["key"] = "x"; },
           "series.measurements[1]: \"key\" is no measurement");
    expect([](Json& series) { series["measurements"][0]["samples"][2]["number"] = "1"; },
           "series.measurements[0].samples[2]: \"number\" is not a number");
    expect([](Json& series) { series["findings"][0]["runs"][0] = -1; },
           "series.findings[0]: \"runs\" has an element that is no count");
    expect([](Json& series) { series["findings"] = Json::array({1}); },
           "series.findings[0] is not an object");
    expect([](Json& series) { series["findings"] = 1; }, "series: \"findings\" is not an array");
    expect([](Json& series) { series["findings"][0]["runs"] = 1; },
           "series.findings[0]: \"runs\" is not an array");
    expect([](Json& series) { series["shown"] = "1"; }, "series: \"shown\" is not a count");
    expect([](Json& series) { series["usable"] = 1; }, "series: \"usable\" is not an object");
    expect([](Json& series) { series["usable"]["opencl"] = "x"; },
           "series.usable: \"opencl\" is \"x\", which is none");
    expect([](Json& series) { series["measurements"][0]["samples"][2]["known"] = 1; },
           "series.measurements[0].samples[2]: \"known\" is not a bool");
}

TEST(MedianReport, HasTheMediansAndElseTheLinesOfTheRunThatIsShown)
{
    const StoredRun run = CollectBandwidths({"9e+11", "5e+11", "5.1e+11", "0"});
    const Report report = MakeMedianReport(run.fReport, *run.fSeries);
    EXPECT_EQ(report.Find("clgpu[0].CLBandwidth")->fValue, "505000000000");
    EXPECT_EQ(report.Find("clgpu[0].CLCompute")->fValue, "1234.56");
    EXPECT_EQ(report.GetLines().size(), run.fReport.GetLines().size());
    EXPECT_EQ(run.fReport.Find("clgpu[0].CLBandwidth")->fValue, "9e+11");
    EXPECT_TRUE(report.IsWhole());
}

TEST(MedianReport, TwoDevicesOfOneNameHaveTheirOwnMedians)
{
    SeriesCollector series({2, 0});
    for (int run = 0; run < 2; ++run)
        AddRun(series, Sample(0, 2).Set("clgpu[0].CLBandwidth", "5e+11"));
    const StoredRun run = series.Finish(SeriesEnd::kDone, 1);
    const Report report = MakeMedianReport(run.fReport, *run.fSeries);
    EXPECT_EQ(report.Find("clgpu[0].CLBandwidth")->fValue, "500000000000");
    EXPECT_EQ(report.Find("clgpu[1].CLBandwidth")->fValue, "834512000000");
}

TEST(MedianReport, LeavesWhatIsNotKnown)
{
    const StoredRun run = CollectBandwidths({"0", "0"});
    EXPECT_EQ(MakeMedianReport(run.fReport, *run.fSeries).Find("clgpu[0].CLBandwidth")->fValue,
              "0");
}

TEST(MedianReport, ADeviceOfAnotherNameIsAnotherOne)
{
    const StoredRun run = CollectBandwidths({"9e+11", "5e+11"});
    const Report other = ReadReport(Sample(0, 1).Set("clgpu[0].CLName", "\"B\"").GetText());
    EXPECT_EQ(MakeMedianReport(other, *run.fSeries).Find("clgpu[0].CLBandwidth")->fValue,
              "8.34512e+11");
}

TEST(TextPlot, DrawsABoxWithItsLinesAndOutliers)
{
    // Quartiles 10 and 20, median 15, fences -5 and 35.
    EXPECT_EQ(MakeTextPlot({5, 10, 15, 20, 60}, 56),
              "|----[====#====]                                       o");
    EXPECT_EQ(MakeTextPlot({0, 10, 15, 20, 30}, 31), "|---------[====#====]---------|");
    EXPECT_EQ(MakeTextPlot({3, 3, 3}, 10), "#");
    EXPECT_EQ(MakeTextPlot({1, 2}, 1), "#");
}

TEST(SeriesView, ShowsFindingsPlotsAndStatistics)
{
    std::ostringstream out;
    PrintSeries(out, *MakeRichSeries().fSeries, 100);
    const std::string text = out.str();
    for (const char* const part :
         {"\nSeries: 9 runs\n--------------\n",
          "Verdicts     8 complete, 1 crashed\n",
          "Asked for    20 runs\n",
          "Ended early  it was interrupted before its end\n",
          "Time         4.50 s\n",
          "Facts above  of run 9, the first with the worst verdict; measurements are medians\n",
          "!            crashed in 1 of 9 runs (run 9): It \\xFE crashed.\n",
          "!            glgpu[0]: GLMemoryMB differed in 2 of 9 runs: 2 (7 runs), 1 (run 8), 24564 "
          "(run 9)\n",
          "\nCopy bandwidth of clgpu[0]: Accelerator 4000\n",
          "  Median     500 GB/s (6 runs)\n",
          "  Quartiles  492.5 GB/s to 507.5 GB/s\n",
          "  Minimum    100 GB/s\n",
          "  Maximum    520 GB/s\n",
          "  Spread     3.0 % of the median between the quartiles\n",
          "  First run  900 GB/s\n",
          "  Outliers   100 GB/s in run 8\n",
          "  Not known  run 9: run ended before\n",
          "  Not known  run 7: the device's clock reported no elapsed time\n",
          "\nCompute score of clgpu[0]: Accelerator 4000\n",
          "  Median     1234.56 (7 runs)\n",
          "\nTime of a run\n"})
        EXPECT_NE(text.find(part), std::string::npos) << part << "\n" << text;
}

} // namespace
} // namespace assay_host
