// Makes the command of a child so that it receives exactly the given arguments. Any thread may
// call.
#pragma once

#include <deque>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"

namespace assay_host {

// The program and the arguments for a pmutil::LaunchParams.
struct ChildCommand {
    std::wstring fProgram;
    std::deque<std::string> fArgs;
};

// `program` is a path; all texts are UTF-8. On Windows fProgram is the whole command line, which
// the launcher passes on unchanged: the launcher's own quoting can't express every argument.
ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args);

// Makes the launcher of this platform. On Linux its child is in a process group of its own, so that
// a signal that the child sends to its group doesn't reach this process.
boost::shared_ptr<pmutil::Launcher> MakeChildLauncher();

} // namespace assay_host
