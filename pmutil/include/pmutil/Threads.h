// Names of threads, as log lines show them. The table lives as long as the process; an entry is
// never removed, so a thread id that the system reuses inherits the old name until it is set again.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// Names the calling thread, for log lines and, where the platform has one, for the debugger.
// Naming it again replaces the name.
void SetCurrentThreadName(const std::string& name);

// The calling thread's name, or its id text if it was never named.
std::string GetCurrentThreadName();

// The operating system's id of the calling thread as MakeThreadIDString writes it.
std::string GetCurrentThreadIDString();

// An id in lower-case hexadecimal without a prefix; "{Not-any-thread}" for 0.
std::string MakeThreadIDString(std::uint64_t number);

} // namespace pmutil
