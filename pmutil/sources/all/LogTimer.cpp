#include "all/LogTimer.h"

#include <atomic>
#include <cstdint>

#include "pmutil/PMLogging.h"
#include "pmutil/System.h"

namespace pmutil {

namespace {
std::atomic<std::int32_t> gLogDepth{0};
std::atomic<double> gLogTime{0};

// Calls of this thread alone. A call within another of its thread can't find the process's depth at
// 0, so that most calls need no atomic operation.
thread_local std::int32_t gThreadDepth = 0;
} // namespace

// Nested calls don't read the clock: what they would measure is dropped anyway.
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
    // A second thread may be outermost at the same time and one of the two sums get lost; that
    // imprecision is cheaper than a lock.
    if (fOutermost)
        gLogTime.store(gLogTime.load(std::memory_order_relaxed) + (GetClockSeconds() - fStartTime),
                       std::memory_order_relaxed);
}

double GetLogTime()
{
    return gLogTime.load(std::memory_order_relaxed);
}

} // namespace pmutil
