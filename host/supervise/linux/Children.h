// The children of a process, as /proc shows them.
#pragma once

#include <sys/types.h>

#include <map>

namespace assay_host {

// Each child's number and the letter of its state ('Z' of one that has ended). Empty if /proc can't
// be read.
std::map<::pid_t, char> ListChildren(::pid_t parent);

} // namespace assay_host
