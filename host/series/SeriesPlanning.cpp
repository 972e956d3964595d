#include "series/SeriesPlanning.h"

#include <algorithm>
#include <cmath>

#include <fmt/format.h>

namespace assay_host {

namespace {

std::string GetDurationText(double seconds)
{
    constexpr double kMinute = 60;
    constexpr double kHour = 60 * kMinute;
    if (seconds < kMinute)
        return fmt::format("{:.0f} s", std::ceil(seconds));
    if (seconds < kHour)
        return fmt::format("{:.0f} min", std::ceil(seconds / kMinute));
    return fmt::format("{:.1f} h", seconds / kHour);
}

} // namespace

bool IsOver(const SeriesPlan& plan, std::size_t runs, double seconds)
{
    return (plan.fRuns > 0 && runs >= plan.fRuns) ||
           (plan.fSeconds > 0 && seconds >= plan.fSeconds);
}

std::optional<double> EstimateSecondsLeft(const SeriesPlan& plan, std::size_t runs, double seconds,
                                          double runSeconds)
{
    std::optional<double> left;
    if (plan.fRuns > runs && runs > 0) {
        const double mean = (seconds - runSeconds) / static_cast<double>(runs);
        const double ofThisRun = std::max(mean - runSeconds, 0.0);
        left = ofThisRun + mean * static_cast<double>(plan.fRuns - runs - 1);
    }
    if (plan.fSeconds > 0) {
        const double ofPlan = std::max(plan.fSeconds - seconds, 0.0);
        left = left ? std::min(*left, ofPlan) : ofPlan;
    }
    return left;
}

std::string GetProgressText(const SeriesPlan& plan, std::size_t runs, double seconds,
                            double runSeconds)
{
    std::string text = fmt::format("run {}", runs + 1);
    if (plan.fRuns > 0)
        text += fmt::format(" of {}", plan.fRuns);
    if (const auto left = EstimateSecondsLeft(plan, runs, seconds, runSeconds))
        text += fmt::format(", about {} left", GetDurationText(*left));
    return text;
}

} // namespace assay_host
