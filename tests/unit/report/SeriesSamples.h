// Makes series for tests.
#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "series/SeriesCollector.h"

namespace assay_host {

inline RunOutcome MakeSeriesOutcome(Verdict verdict, const std::string& reason = "As expected.",
                                    double seconds = 0.5)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fReason = reason;
    outcome.fSeconds = seconds;
    return outcome;
}

// A run whose report is whole.
inline void AddRun(SeriesCollector& series, Sample sample)
{
    series.Add(ReadReport(sample.GetText()), MakeSeriesOutcome(Verdict::kComplete));
}

// Collects runs of one OpenCL device that differ in these values of CLBandwidth.
inline StoredRun CollectBandwidths(const std::vector<std::string>& values)
{
    SeriesPlan plan;
    plan.fRuns = values.size();
    SeriesCollector series(plan);
    for (const std::string& value : values)
        AddRun(series, Sample(0, 1).Set("clgpu[0].CLBandwidth", value));
    return series.Finish(SeriesEnd::kDone, 9.5);
}

inline std::vector<std::string> GetTexts(const std::vector<SeriesFinding>& findings)
{
    std::vector<std::string> texts;
    for (const SeriesFinding& finding : findings)
        texts.push_back(finding.fCode + ": " + finding.fTag + ": " + finding.fText);
    return texts;
}

} // namespace assay_host
