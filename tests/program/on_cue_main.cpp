// assay-host for tests of outcomes, which must not depend on the machine's speed. Everything that
// has to happen in time has ten minutes. A run's timeout passes when a test, or its child, creates
// the file that ASSAY_TEST_CUE names: the clock is then an hour ahead. With ASSAY_TEST_UNREAD, an
// interrupted run doesn't wait for the readers of its output.
#include <chrono>
#include <cstdlib>

#include <boost/filesystem/operations.hpp>

#include "app/HostMain.h"
#include "pmutil/PMLogging.h"
#include "supervise/RunTimes.h"

namespace {

constexpr int kPatience = 600; // seconds

pmutil::DebugValue gShortWait{"ConsoleAppShortWaitSecondsMinusOne", 0};

assay_host::RunTimes::Clock::time_point ReadClock()
{
    const auto now = assay_host::RunTimes::Clock::now();
    const char* const cue = std::getenv("ASSAY_TEST_CUE");
    boost::system::error_code error;
    return cue != nullptr && boost::filesystem::exists(cue, error) ? now + std::chrono::hours(1)
                                                                   : now;
}

} // namespace

int main(int argc, char** argv)
{
    assay_host::RunTimes& times = assay_host::DefaultRunTimes();
    times.fNow = &ReadClock;
    times.fKillGrace = times.fLastStreamGrace = assay_host::RunTimes::Seconds(kPatience);
    times.fTreeSeconds = times.fJoinSeconds = kPatience;
    times.fReaderPatience =
        std::chrono::seconds(std::getenv("ASSAY_TEST_UNREAD") != nullptr ? 0 : kPatience);
    pmutil::InitLogging(); // required to resolve the name
    pmutil::GetDebugValue(gShortWait) = kPatience;
    return assay_host::RunHost(argc, argv);
}
