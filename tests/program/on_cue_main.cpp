// assay-host, for which an hour passes when the file that ASSAY_TEST_CUE names comes into being:
// the only difference from the real one. A test, or its child, decides so when a timeout runs out.
#include <chrono>
#include <cstdlib>

#include <boost/filesystem/operations.hpp>

#include "app/HostMain.h"
#include "supervise/RunTimes.h"

int main(int argc, char** argv)
{
    assay_host::DefaultRunTimes().fNow = [] {
        const auto now = assay_host::RunTimes::Clock::now();
        const char* const cue = std::getenv("ASSAY_TEST_CUE");
        boost::system::error_code error;
        return cue != nullptr && boost::filesystem::exists(cue, error) ? now + std::chrono::hours(1)
                                                                       : now;
    };
    return assay_host::RunHost(argc, argv);
}
