// What a broken driver may do to its process.
#pragma once

#include <string>

// access-violation, abort, assert, terminate, fast-fail, stack-overflow, exit (with the status 0)
// or hang; anything else does nothing.
void Misbehave(const std::string& how);
