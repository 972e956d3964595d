#include "Clock.h"

#include <chrono>

#include "pmutil/System.h"

namespace {

SteppingClock* gClock = nullptr;

} // namespace

SteppingClock::SteppingClock(double step) : fStep(step)
{
    gClock = this;
}

SteppingClock::~SteppingClock()
{
    gClock = nullptr;
}

double pmutil::GetClockSeconds()
{
    if (gClock != nullptr)
        return gClock->fSeconds += gClock->fStep;
    return std::chrono::duration<double>(std::chrono::system_clock::now().time_since_epoch())
        .count();
}
