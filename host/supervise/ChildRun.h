// Runs the child under supervision, from its launch to the verdict.
#pragma once

#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/StopRequest.h"
#include "report/ReportReader.h"
#include "report/RunOutcome.h"
#include "supervise/Containment.h"
#include "supervise/RunTimes.h"

namespace assay_host {

struct ChildOptions {
    std::string fProgram; // its path
    std::vector<std::string> fArgs;
    double fTimeoutSeconds = 60; // 0: no limit
    // Requests the child's log with -verbose=0x101, unless the arguments have a -verbose= option,
    // and takes the causes of failures and the files of drivers from it. The lines of this log
    // aren't part of the report.
    bool fKeepCauses = false;
    ReportReader::Limits fLimits;
};

// Called while the child runs, on the thread that called RunChild. This thread supervises the
// child, so that no call may block. An exception of a call kills the child and leaves RunChild.
// `seconds` is the time since the launch.
class RunObserver {
public:
    virtual ~RunObserver() = default;
    virtual void OnStart() {}
    virtual void OnLine(const ReportLine& /*line*/, double /*seconds*/) {}
    // A line of the log that fKeepCauses requests, without its line end.
    virtual void OnLogLine(const std::string& /*line*/, double /*seconds*/) {}
    virtual void OnErrorLine(const std::string& /*line*/, double /*seconds*/) {}
    virtual void OnTick(double /*seconds*/) {} // about ten times a second
};

// Launches the child with its standard input closed, waits for its end, kills it after the timeout,
// kills the processes that it left behind, and derives the verdict. Returns within the timeout plus
// two seconds. Failures of the child or the system are in the outcome, not thrown.
//
// Raising `stop` kills the child at once, with the verdict interrupted; if it is already raised, no
// child is started.
//
// The containment is only for this run. Its descendants are killed after a kill of the child, or
// when the streams don't end with it.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                    Containment& containment, const RunTimes& times);

// The same with MakeOwnContainment() and DefaultRunTimes(). One run at a time in a process.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop);

// The same with another launcher, used only for this run, and with other times.
RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                    const boost::shared_ptr<pmutil::Launcher>& launcher, const RunTimes& times);

} // namespace assay_host
