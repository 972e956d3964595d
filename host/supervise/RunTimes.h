// How long the steps of a supervised run may take, and by which clock.
#pragma once

#include <chrono>
#include <functional>

namespace assay_host {

// All that follows the timeout has to fit into two seconds, of which pmutil takes one if its launch
// has to be given up.
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
    // For each piece of the output of an interrupted run to be read, by the system's clock.
    std::chrono::milliseconds fReaderPatience{1000};
};

// The times of a run that gets none. Tests of whole programs change them before the first run.
RunTimes& DefaultRunTimes();

} // namespace assay_host
