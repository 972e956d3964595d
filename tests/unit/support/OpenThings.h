// Counts this process's system objects, for tests that check for leaks.
#pragma once

// Counts open descriptors, or handles.
long CountOpenThings();

// Counts the threads of this process.
long CountThreads();

// Whether this process has a child, running or not reaped.
bool HasChildren();

// The number of handles that a launch never closes.
extern const long kKeptPerLaunch;
