// Lists the children of a process by /proc.
#pragma once

#include <sys/types.h>

#include <map>

namespace assay_host {

// Returns each child's process id and the letter of its state ('Z' for a zombie). Empty if /proc
// can't be read. Any thread may call.
std::map<::pid_t, char> ListChildren(::pid_t parent);

} // namespace assay_host
