// What this process holds of the system's things, for tests that count what is left over.
#pragma once

// Descriptors, or handles.
long CountOpenThings();

// All threads of this process.
long CountThreads();

// True if this process has a child at all, running or ended.
bool HasChildren();

// The handles that a launch leaves open for good.
extern const long kKeptPerLaunch;
