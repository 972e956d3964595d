#include "series/SeriesChange.h"

#include <algorithm>
#include <cmath>

#include <fmt/format.h>

#include "report/ValueText.h"
#include "series/SeriesStatistics.h"
#include "statistics/ChangeTest.h"

namespace assay_host {

namespace {

// Returns the statistics of the measurement; nothing if no later run has it.
std::optional<SeriesStatistics> FindStatistics(const Series& series, const DeviceAnswers& device,
                                               const std::string& key)
{
    for (const Measurement& measurement : series.fMeasurements) {
        if (measurement.fKey == nullptr || measurement.fKey->fKey != key ||
            measurement.fTag != device.fTag || measurement.fName != GetDeviceName(device))
            continue;
        SeriesStatistics statistics = GetStatistics(measurement);
        if (statistics.fSummary)
            return statistics;
    }
    return std::nullopt;
}

// The samples that each of two series of one size needs for a change.
std::size_t GetNeededCount()
{
    std::size_t count = 1;
    while (GetSmallestP(count, count) > kChangeLevel)
        ++count;
    return count;
}

} // namespace

std::optional<MeasurementChange> CompareSeries(const Series& before, const Series& after,
                                               const DeviceAnswers& deviceBefore,
                                               const DeviceAnswers& deviceAfter,
                                               const std::string& key,
                                               std::optional<double> tolerance)
{
    const auto left = FindStatistics(before, deviceBefore, key);
    const auto right = FindStatistics(after, deviceAfter, key);
    if (!left || !right)
        return std::nullopt;
    const std::string medians =
        fmt::format("medians of {} and {} runs", left->fLater.size(), right->fLater.size());
    const ChangeTest test = TestChange(left->fLater, right->fLater);
    if (test.fChange == Change::kTooFew)
        return MeasurementChange{
            false, fmt::format("{}; too few to tell a change from noise, which takes {} each",
                               medians, GetNeededCount())};
    const double from = left->fSummary->fMedian;
    const double to = right->fSummary->fMedian;
    const bool isLarge =
        !tolerance || std::abs(from - to) > *tolerance * std::max(std::abs(from), std::abs(to));
    const std::string reason = test.fChange == Change::kNoise ? "within the noise"
                               : !isLarge                     ? "within the tolerance"
                                                              : "larger than the noise";
    return MeasurementChange{test.fChange == Change::kChange && isLarge,
                             fmt::format("{:+.3g} %, {}; {}; Mann-Whitney U test, {}: p = {:.2g}",
                                         (to / from - 1) * 100, reason, medians,
                                         test.fRanks.fIsExact ? "exact" : "normal approximation",
                                         test.fRanks.fP)};
}

} // namespace assay_host
