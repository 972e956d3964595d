// Counts this process's system objects, for tests that check for leaks.
#pragma once

// Counts open descriptors, or handles.
long CountOpenThings();

// The number of open things that runs which close all may add. On Windows a lock of the process
// gets a handle when threads first compete for it, so that only a handle per run is a leak.
long GetMaxGrowth(long runs);

// Counts the threads of this process.
long CountThreads();

// Whether this process has a child, running or not reaped.
bool HasChildren();

// The number of handles that a launch never closes.
extern const long kKeptPerLaunch;
