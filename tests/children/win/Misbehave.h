// Ends a process in the ways of broken drivers.
#pragma once

#include <string>

// Accepts access-violation, abort, assert, terminate, fast-fail, stack-overflow, exit (with the
// status 0) and hang. Returns for any other text.
void Misbehave(const std::string& how);
