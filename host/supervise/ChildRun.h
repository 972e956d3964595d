// One supervised run of the child, from launch to verdict.
#pragma once

#include <chrono>
#include <functional>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/StopRequest.h"
#include "report/ReportReader.h"
#include "report/RunOutcome.h"

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

// How long each step of a run may take. All that follows the timeout has to fit into two seconds,
// of which pmutil takes one if its launch has to be given up.
struct RunTimes {
    using Clock = std::chrono::steady_clock;
    using Seconds = std::chrono::duration<double>;

    std::function<Clock::time_point()> fNow = &Clock::now; // of these times and of the timeout
    std::chrono::milliseconds fTick{100}; // a longer pause counts as one in the graces
    Seconds fKillGrace{0.7};              // for a killed child to end
    Seconds fStreamGrace{0.2};            // for the streams to end after the child
    Seconds fLastStreamGrace{0.2};        // for the streams to end after the descendants
    double fTreeSeconds = 0.2;            // for the descendants to end, by the system's clock
    double fJoinSeconds = 0.3; // for the launch to end after the child, by the system's clock
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
                    const boost::shared_ptr<pmutil::Launcher>& launcher,
                    const RunTimes& times = {});

} // namespace assay_host
