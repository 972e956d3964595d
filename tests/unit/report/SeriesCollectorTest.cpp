#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

#include "SeriesSamples.h"
#include "series/DeviceList.h"
#include "series/SeriesStatistics.h"

namespace assay_host {
namespace {

using Texts = std::vector<std::string>;

const Measurement& FindMeasurement(const Series& series, const std::string& key,
                                   const std::string& name = "Accelerator 4000")
{
    for (const Measurement& measurement : series.fMeasurements)
        if (measurement.GetKeyName() == key && (key == "seconds" || measurement.fName == name))
            return measurement;
    throw std::logic_error("no such measurement");
}

TEST(SeriesCollector, KeepsAllSamplesAndNamesThoseThatAreNotKnown)
{
    const StoredRun run = CollectBandwidths({"5e+11", "0", "4e+11", "1e+14", "6e+11", "-1", "inf"});
    const Measurement& measurement = FindMeasurement(*run.fSeries, "CLBandwidth");
    EXPECT_EQ(measurement.fTag, "clgpu[0]");
    ASSERT_EQ(measurement.fSamples.size(), 7U);
    for (std::size_t index = 0; index < 7; ++index)
        EXPECT_EQ(measurement.fSamples[index].fRun, index + 1);
    EXPECT_EQ(measurement.fSamples[1].fReason, "the device's clock reported no elapsed time");
    EXPECT_EQ(measurement.fSamples[1].fText, "0");
    EXPECT_EQ(measurement.fSamples[3].fReason, "the device's clock is unreliable");
    const SeriesStatistics statistics = GetStatistics(measurement);
    EXPECT_EQ(statistics.fFirst, 5e11);
    EXPECT_EQ(statistics.fLater, (std::vector<double>{4e11, 6e11}));
    EXPECT_EQ(statistics.fUnknown.size(), 4U);
    EXPECT_EQ(GetTypicalValue(measurement), 5e11);
    EXPECT_EQ(
        GetTexts(run.fSeries->fFindings),
        (Texts{"not-measured: clgpu[0]: CLBandwidth is not known in 3 of 7 runs (runs 4, 6, 7): "
               "the device's clock is unreliable",
               "not-measured: clgpu[0]: CLBandwidth is not known in 1 of 7 runs (run 2): the "
               "device's clock reported no elapsed time"}));
}

TEST(SeriesCollector, AMeasurementThatNoRunKnowsIsNoFinding)
{
    const StoredRun run = CollectBandwidths({"0", "0", "0"});
    EXPECT_TRUE(run.fSeries->fFindings.empty());
    const SeriesStatistics statistics = GetStatistics(FindMeasurement(*run.fSeries, "CLBandwidth"));
    EXPECT_FALSE(statistics.fSummary);
    EXPECT_FALSE(GetTypicalValue(FindMeasurement(*run.fSeries, "CLBandwidth")));
}

TEST(SeriesCollector, TheFirstRunIsApartAndOutliersAreNamed)
{
    const StoredRun run =
        CollectBandwidths({"9e+11", "5e+11", "5.1e+11", "4.9e+11", "5e+11", "1e+11"});
    const SeriesStatistics statistics = GetStatistics(FindMeasurement(*run.fSeries, "CLBandwidth"));
    EXPECT_EQ(statistics.fFirst, 9e11);
    EXPECT_EQ(statistics.fSummary->fMaximum, 5.1e11);
    EXPECT_EQ(statistics.fSummary->fMinimum, 1e11);
    ASSERT_EQ(statistics.fOutliers.size(), 1U);
    EXPECT_EQ(statistics.fOutliers[0].fRun, 6U);
    EXPECT_EQ(statistics.fOutliers[0].fValue, 1e11);
}

TEST(SeriesCollector, OneRunHasOnlyAFirst)
{
    const StoredRun run = CollectBandwidths({"5e+11"});
    const Measurement& measurement = FindMeasurement(*run.fSeries, "CLBandwidth");
    EXPECT_FALSE(GetStatistics(measurement).fSummary);
    EXPECT_EQ(GetTypicalValue(measurement), 5e11);
}

TEST(SeriesCollector, FactsThatChangeAreFindings)
{
    SeriesCollector series({});
    for (int run = 1; run <= 10; ++run)
        AddRun(series, Sample(1, 1)
                           .Set("glgpu[0].GLMemoryMB", run == 3 || run == 7 ? "4095" : "4096")
                           .Set("clgpu[0].CUDAVersion", run == 9 ? "" : "\"12\"")
                           .Set("clgpu[0].CUDASupported", run == 9 ? "0" : "1")
                           .Set("assayStart", "\"2026-11-21_10:49:" + std::to_string(run) + "0\""));
    const StoredRun run = series.Finish(SeriesEnd::kDone, 1);
    EXPECT_EQ(
        GetTexts(run.fSeries->fFindings),
        (Texts{"fact-changed: glgpu[0]: GLMemoryMB differed in 2 of 10 runs: 4096 (8 runs), "
               "4095 (runs 3, 7)",
               "fact-changed: clgpu[0]: CUDASupported differed in 1 of 10 runs: 1 (9 runs), 0 "
               "(run 9)",
               "fact-changed: clgpu[0]: CUDAVersion differed in 1 of 10 runs: \"12\" (9 runs), "
               "not printed by this device (run 9)"}));
    EXPECT_EQ(run.fSeries->fFindings[0].fCount, 2U);
    EXPECT_EQ(run.fSeries->fFindings[0].fRuns, (std::vector<std::size_t>{3, 7}));
}

TEST(SeriesCollector, TheWorstRunIsShownAndTheOthersCount)
{
    SeriesCollector series({});
    AddRun(series, Sample(1, 1));
    series.Add(ReadReport(Sample(1, 1).EndAfter("glgpu[0].GLName").GetText()),
               MakeSeriesOutcome(Verdict::kCrashed, "It crashed."));
    series.Add(ReadReport(Sample(1, 1).GetText()),
               MakeSeriesOutcome(Verdict::kFailedTests, "It failed."));
    series.Add(ReadReport(Sample(1, 1).EndAfter("assayStart").GetText()),
               MakeSeriesOutcome(Verdict::kCrashed, "It crashed."));
    AddRun(series, Sample(1, 1));
    const StoredRun run = series.Finish(SeriesEnd::kDone, 3);
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kCrashed);
    EXPECT_EQ(run.fSeries->fShown, 2U);
    EXPECT_NE(run.fReport.Find("glgpu[0].GLName"), nullptr);
    EXPECT_EQ(run.fSeries->fRuns, 5U);
    EXPECT_EQ(run.fSeries->fSeconds, 3);
    ASSERT_EQ(run.fSeries->fVerdicts.size(), 3U);
    EXPECT_EQ(run.fSeries->fVerdicts[2].fVerdict, Verdict::kCrashed);
    EXPECT_EQ(run.fSeries->fVerdicts[2].fRuns, 2U);
    EXPECT_EQ(run.fSeries->fOpenGL, Usability::kBroken);
    EXPECT_EQ(run.fSeries->fOpenCL, Usability::kUnknown);
    // A run that ended before a fact says nothing about it.
    EXPECT_EQ(GetTexts(run.fSeries->fFindings),
              (Texts{"verdict: : failed-tests in 1 of 5 runs (run 3): It failed.",
                     "verdict: : crashed in 2 of 5 runs (runs 2, 4): It crashed.",
                     "usable-changed: : the answer for OpenGL differed in 2 of 5 runs: hardware "
                     "(runs 1, 3, 5), broken (run 2), unknown (run 4)",
                     "usable-changed: : the answer for OpenCL differed in 2 of 5 runs: hardware "
                     "(runs 1, 3, 5), unknown (runs 2, 4)"}));
    const Measurement& time = FindMeasurement(*run.fSeries, "seconds");
    EXPECT_EQ(time.fSamples[0].fValue, 0.5);
    EXPECT_EQ(time.fSamples[1].fReason, "the run was not complete");
}

TEST(SeriesCollector, AnInterruptedRunIsNotShownAfterOthers)
{
    SeriesCollector series({});
    AddRun(series, Sample(0, 1));
    series.Add(ReadReport(Sample(0, 1).EndAfter("clgpu[0].CLBandwidth").GetText()),
               MakeSeriesOutcome(Verdict::kInterrupted, "Interrupted."));
    const StoredRun run = series.Finish(SeriesEnd::kInterrupted, 3);
    EXPECT_EQ(run.fSeries->fShown, 1U);
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kInterrupted);
    EXPECT_EQ(run.fOutcome.fReason, "The series was interrupted in or after its run 2.");
    EXPECT_TRUE(run.fReport.IsWhole());
    EXPECT_EQ(run.fSeries->fOpenCL, Usability::kHardware);
    EXPECT_TRUE(FindMeasurement(*run.fSeries, "CLBandwidth").fSamples[1].IsKnown());
    EXPECT_EQ(FindMeasurement(*run.fSeries, "CLCompute").fSamples[1].fReason, "run ended before");
}

TEST(SeriesCollector, AnInterruptedFirstRunIsShown)
{
    SeriesCollector series({});
    series.Add(ReadReport(std::string()), MakeSeriesOutcome(Verdict::kInterrupted, "At once."));
    const StoredRun run = series.Finish(SeriesEnd::kInterrupted, 0);
    EXPECT_EQ(run.fOutcome.fReason, "At once.");
    EXPECT_EQ(run.fSeries->fShown, 1U);
}

TEST(SeriesCollector, DevicesThatChangePlacesKeepTheirSamples)
{
    SeriesCollector series({});
    const auto add = [&](const char* first, const char* second, const char* ofFirst,
                         const char* ofSecond) {
        AddRun(series, Sample(0, 2)
                           .Set("clgpu[0].CLName", first)
                           .Set("clgpu[1].CLName", second)
                           .Set("clgpu[0].CLBandwidth", ofFirst)
                           .Set("clgpu[1].CLBandwidth", ofSecond));
    };
    add("\"A\"", "\"B\"", "1e+11", "2e+11");
    add("\"A\"", "\"B\"", "1.1e+11", "2.1e+11");
    add("\"B\"", "\"A\"", "2.2e+11", "1.2e+11");
    const StoredRun run = series.Finish(SeriesEnd::kDone, 1);
    EXPECT_EQ(GetStatistics(FindMeasurement(*run.fSeries, "CLBandwidth", "A")).fLater,
              (std::vector<double>{1.1e11, 1.2e11}));
    EXPECT_EQ(GetStatistics(FindMeasurement(*run.fSeries, "CLBandwidth", "B")).fLater,
              (std::vector<double>{2.1e11, 2.2e11}));
    EXPECT_EQ(GetTexts(run.fSeries->fFindings),
              (Texts{"device-moved: clgpu[0]: the place of clgpu[0] \"A\" differed in 1 of 3 runs: "
                     "clgpu[0] (runs 1, 2), clgpu[1] (run 3)",
                     "device-moved: clgpu[1]: the place of clgpu[1] \"B\" differed in 1 of 3 runs: "
                     "clgpu[1] (runs 1, 2), clgpu[0] (run 3)"}));
}

TEST(SeriesCollector, ADeviceThatComesAndGoesIsAFinding)
{
    SeriesCollector series({});
    AddRun(series, Sample(0, 1));
    AddRun(series, Sample(0, 2).Set("clgpu[1].CLName", "\"B\""));
    AddRun(series, Sample(0, 1));
    series.Add(ReadReport(Sample(0, 1).EndAfter("NumGLGPUs").GetText()),
               MakeSeriesOutcome(Verdict::kHung, "It hung."));
    const StoredRun run = series.Finish(SeriesEnd::kDone, 1);
    const Texts texts = GetTexts(run.fSeries->fFindings);
    ASSERT_EQ(texts.size(), 4U);
    EXPECT_EQ(texts[2],
              "device-absent: clgpu[1]: clgpu[1] \"B\" was missing in 2 of 3 runs (runs 1, 3)");
    EXPECT_EQ(texts[3],
              "fact-changed: : NumCLGPUs differed in 1 of 3 runs: 1 (runs 1, 3), 2 (run 2)");
}

TEST(SeriesCollector, IsFullWithAsManySamplesAsADocumentCanHave)
{
    // Each run has two measurements and its time.
    SeriesCollector series({}, 10);
    for (int run = 1; run <= 3; ++run) {
        AddRun(series, Sample(0, 1));
        EXPECT_FALSE(series.IsFull());
    }
    AddRun(series, Sample(0, 1));
    EXPECT_TRUE(series.IsFull());
}

TEST(DeviceList, FindsADeviceByNameAndIndexThenByNameThenByIndex)
{
    DeviceList list;
    const auto match = [&list](const std::string& text) {
        const Report report = ReadReport(text);
        return list.Match(GetAnswers(report).fDevices);
    };
    const auto name = [](int index, const char* text) {
        return "glgpu[" + std::to_string(index) + "].GLName=\"" + text + "\"\n";
    };
    using Places = std::vector<std::size_t>;
    EXPECT_EQ(match(name(0, "A") + name(1, "A")), (Places{0, 1}));
    EXPECT_EQ(match(name(1, "A")), Places{1});
    EXPECT_EQ(match(name(2, "A") + name(3, "A")), (Places{0, 1}));
    EXPECT_EQ(match(name(2, "A") + name(3, "A") + name(4, "A")), (Places{0, 1, 2}));
    EXPECT_EQ(match(name(0, "B")), Places{0});
    EXPECT_EQ(match("clgpu[0].CLName=\"A\"\n"), Places{3});
    DeviceList nameless;
    const auto matchTag = [&nameless](const std::string& tag) {
        const Report report = ReadReport(tag + ".x=1\n");
        return nameless.Match(GetAnswers(report).fDevices);
    };
    EXPECT_EQ(matchTag("glgpu[0]"), Places{0});
    EXPECT_EQ(matchTag("glgpu[1]"), Places{1});
    EXPECT_EQ(matchTag("clgpu[0]"), Places{2});
}

TEST(FactLog, KeepsAFewValuesAndCountsTheOthers)
{
    FactLog log;
    for (std::size_t run = 1; run <= 30; ++run)
        log.Add(run, 0, "name", std::to_string(run < 5 ? 0 : run));
    const std::vector<ChangedFact> changed = log.GetChanged();
    ASSERT_EQ(changed.size(), 1U);
    EXPECT_EQ(changed[0].fValues.size(), 8U);
    EXPECT_EQ(changed[0].fValues[0].fRuns.GetText(), "runs 1, 2, 3, 4");
    EXPECT_EQ(changed[0].fOthers.GetCount(), 19U);
    EXPECT_EQ(changed[0].fDiffering.GetCount(), 26U);
    EXPECT_EQ(changed[0].fDiffering.GetNamed().size(), kMaxNamedRuns);
    EXPECT_EQ(changed[0].fDiffering.GetText(), "runs 5, 6, 7, 8, 9 and 21 more");
    EXPECT_EQ(changed[0].fRuns, 30U);
}

TEST(FactLog, HasALimit)
{
    FactLog log;
    const std::string large(1 << 20, 'x');
    for (std::size_t fact = 0; fact < 20; ++fact) {
        log.Add(1, 0, std::to_string(fact), large);
        log.Add(2, 0, std::to_string(fact), "");
    }
    // The sixteenth doesn't fit beside what else is kept of the others.
    EXPECT_EQ(log.GetChanged().size(), 15U);
}

} // namespace
} // namespace assay_host
