// Makes the launcher of the supervised child.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"

namespace assay_host {

// Makes the launcher of this platform. On Linux its child is in a process group of its own, so that
// a signal that the child sends to its group doesn't reach this process. Any thread may call.
boost::shared_ptr<pmutil::Launcher> MakeChildLauncher();

} // namespace assay_host
