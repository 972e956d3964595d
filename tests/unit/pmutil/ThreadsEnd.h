// Waits for threads that nobody joins.
#pragma once

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/recursive_mutex.hpp>
#include <boost/thread/thread.hpp>
#include <gtest/gtest.h>

#include "OpenThings.h"
#include "pmutil/PMLogging.h"
#include "support/Waits.h"

namespace pmutil {

// Threads that are given up log until they end, and nobody joins them: this waits for that when it
// goes.
class ThreadsEnd {
public:
    ~ThreadsEnd()
    {
        EXPECT_TRUE(Eventually([&] { return CountThreads() <= fThreads; }));
        const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
    }

private:
    static long CountIdle()
    {
        boost::thread([] {}).join(); // a sanitizer adds one of its own to the first
        return CountThreads();
    }

    const long fThreads = CountIdle();
};

} // namespace pmutil
