#include "all/LogTimer.h"

#include <atomic>
#include <cstdint>

#include "pmutil/PMLogging.h"
#include "pmutil/System.h"

namespace pmutil {

namespace {
std::atomic<std::int32_t> gLogDepth{0};
std::atomic<double> gLogTime{0};

// The depth of this thread's calls. A nested call of a thread is never the process's outermost one,
// so it needs no atomic operation.
thread_local std::int32_t gThreadDepth = 0;
} // namespace

// Nested calls don't read the clock, since only the outermost call counts.
LogTimer::LogTimer()
    : fOutermost(gThreadDepth++ == 0 && gLogDepth.fetch_add(1, std::memory_order_relaxed) == 0)
{
    if (fOutermost)
        fStartTime = GetClockSeconds();
}

LogTimer::~LogTimer()
{
    if (--gThreadDepth == 0)
        gLogDepth.fetch_sub(1, std::memory_order_relaxed);
    // If two threads are outermost at the same time, one of the two sums may be lost. That is
    // accepted; a lock would cost more.
    if (fOutermost)
        gLogTime.store(gLogTime.load(std::memory_order_relaxed) + (GetClockSeconds() - fStartTime),
                       std::memory_order_relaxed);
}

double GetLogTime()
{
    return gLogTime.load(std::memory_order_relaxed);
}

} // namespace pmutil
