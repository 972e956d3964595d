// One supervised run of the child, from launch to verdict.
#pragma once

#include <string>
#include <vector>

#include "report/ReportReader.h"
#include "report/RunOutcome.h"

namespace assay_host {

struct ChildOptions {
    std::wstring fProgram;
    std::vector<std::string> fArgs;
    double fTimeoutSeconds = 60;
    ReportReader::Limits fLimits;
};

// Told what comes while the child runs. All calls come from one thread at a time, the one that
// called RunChild.
class RunObserver {
public:
    virtual ~RunObserver() = default;
    virtual void OnStart() {}
    virtual void OnLine(const ReportLine& /*line*/, double /*seconds*/) {}
    virtual void OnErrorLine(const std::string& /*line*/, double /*seconds*/) {}
    virtual void OnTick(double /*seconds*/) {} // ten times a second
};

// Launches the child, waits for its end no longer than the timeout, kills it then, and judges.
// Returns within the timeout plus two seconds, whatever the child does. Never throws for what the
// child or the system does; that is in the outcome.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer);

} // namespace assay_host
