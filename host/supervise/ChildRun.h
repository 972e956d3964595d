// One supervised run of the child, from launch to verdict.
#pragma once

#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/StopRequest.h"
#include "report/ReportReader.h"
#include "report/RunOutcome.h"
#include "supervise/RunTimes.h"

namespace assay_host {

struct ChildOptions {
    std::string fProgram; // its path
    std::vector<std::string> fArgs;
    double fTimeoutSeconds = 60; // 0: no limit
    // Asks the child for its log by -verbose=1, unless the arguments have a -verbose= of their own,
    // and takes the causes of failures from it. The lines of that log are no part of the report and
    // reach no observer.
    bool fKeepCauses = false;
    ReportReader::Limits fLimits;
};

// Called while the child runs, on the thread that called RunChild. That thread supervises the
// child, so no call may block. An exception of a call ends the child and leaves RunChild.
class RunObserver {
public:
    virtual ~RunObserver() = default;
    virtual void OnStart() {}
    virtual void OnLine(const ReportLine& /*line*/, double /*seconds*/) {}
    virtual void OnErrorLine(const std::string& /*line*/, double /*seconds*/) {}
    virtual void OnTick(double /*seconds*/) {} // about ten times a second
};

// Launches the child with its standard input closed, waits for its end no longer than the timeout,
// kills it then, ends what it left behind, and judges. Returns within the timeout plus two seconds,
// whatever the child does. Never throws for what the child or the system does; that is in the
// outcome.
//
// Raising `stop` kills the child at once, with the verdict interrupted; if it was raised before, no
// child is started.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop);

// The same with another launcher, used for this run alone, and with other times.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                    const boost::shared_ptr<pmutil::Launcher>& launcher, const RunTimes& times);

} // namespace assay_host
