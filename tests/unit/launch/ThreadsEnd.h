// Waits for threads that are not joined.
#pragma once

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/recursive_mutex.hpp>
#include <boost/thread/thread.hpp>
#include <gtest/gtest.h>

#include "pmutil/PMLogging.h"
#include "support/OpenThings.h"
#include "support/Waits.h"

namespace pmutil {

// Abandoned threads log until they end, and are never joined: the destructor waits for their end.
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
        boost::thread([] {}).join(); // with the first thread, a sanitizer starts one of its own
        return CountThreads();
    }

    const long fThreads = CountIdle();
};

} // namespace pmutil
