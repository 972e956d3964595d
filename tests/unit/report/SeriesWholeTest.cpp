// Initial values and names of a series, and its view as a whole.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "SeriesSamples.h"
#include "series/FactLog.h"
#include "series/SeriesView.h"

namespace assay_host {
namespace {

TEST(Series, HasNothingAtFirst)
{
    const Series series;
    EXPECT_EQ(series.fPlan.fRuns + series.fRuns, 0U);
    EXPECT_EQ(series.fPlan.fSeconds, 0);
    EXPECT_EQ(series.fSeconds, 0);
    EXPECT_EQ(series.fShown, 1U);
    EXPECT_EQ(series.fEnd, SeriesEnd::kDone);
    EXPECT_EQ(series.fOpenGL, Usability::kUnknown);
    EXPECT_EQ(series.fOpenCL, Usability::kUnknown);
    const SeriesSample sample;
    EXPECT_EQ(sample.fRun, 1U);
    EXPECT_EQ(sample.fValue, 0);
    EXPECT_EQ(SeriesFinding().fCount, 0U);
    EXPECT_EQ(Measurement().GetKeyName(), "seconds");
}

TEST(SeriesPlan, IsAskedForWithEitherLimit)
{
    EXPECT_FALSE((SeriesPlan{0, 0}).IsAsked());
    EXPECT_TRUE((SeriesPlan{1, 0}).IsAsked());
    EXPECT_TRUE((SeriesPlan{0, 0.5}).IsAsked());
}

TEST(Series, NamesItsEnds)
{
    EXPECT_STREQ(GetSeriesEndName(SeriesEnd::kDone), "done");
    EXPECT_STREQ(GetSeriesEndName(SeriesEnd::kInterrupted), "interrupted");
    EXPECT_STREQ(GetSeriesEndName(SeriesEnd::kGivenUp), "given-up");
    EXPECT_STREQ(GetSeriesEndName(SeriesEnd::kFull), "full");
}

// Each fact counts as 200 bytes and those of its texts, up to 16 MiB.
TEST(FactLog, HoldsItsLimitToTheByte)
{
    constexpr std::size_t kLimit = std::size_t{16} << 20;
    for (const std::size_t beyond : {0U, 1U}) {
        FactLog one;
        one.Add(1, 0, "a", std::string(kLimit - 201 + beyond, 'x'));
        one.Add(2, 0, "a", "");
        EXPECT_EQ(one.GetChanged().size(), 1 - beyond);
        FactLog two;
        two.Add(1, 0, "a", std::string(1000, 'x'));
        two.Add(1, 0, "b", std::string(kLimit - 1402 + beyond, 'x'));
        two.Add(2, 0, "b", "");
        EXPECT_EQ(two.GetChanged().size(), 1 - beyond);
    }
}

// The whole text of a small series.
TEST(SeriesView, HasItsRowsInTheirOrder)
{
    Series series;
    series.fRuns = 4;
    series.fSeconds = 2;
    series.fVerdicts = {{Verdict::kComplete, 3}, {Verdict::kHung, 1}};
    series.fFindings = {{"x", "", "something", 1, {4}}};
    Measurement time;
    time.fSamples = {{1, 3, {}, {}}, {2, 1, {}, {}}, {3, 2, {}, {}}, {4, 0, "why", "0"}};
    series.fMeasurements = {time};
    std::ostringstream out;
    PrintSeries(out, series, 40);
    EXPECT_EQ(out.str(), R"(
Series: 4 runs
--------------
  Verdicts     3 complete, 1 hung
  Time         2.00 s
  Facts above  of run 1, the first with
               the worst verdict;
               measurements are medians
  !            something

Time of a run
-------------
  |--------[=========#========]--------|
  Median     1.5 s (2 runs)
  Quartiles  1.25 s to 1.75 s
  Minimum    1 s
  Maximum    2 s
  Spread     33.3 % of the median
             between the quartiles
  First run  3 s
  Not known  run 4: why
)");
}

} // namespace
} // namespace assay_host
