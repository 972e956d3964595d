// Collects the values of a run's report.
#pragma once

#include "report/Report.h"
#include "supervise/ChildRun.h"

namespace assay_host {

class ValueCollector : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        if (line.fKind == LineKind::kValue)
            fReport.Add(line);
    }

    Report fReport;
};

} // namespace assay_host
