// A ConsoleApp for clients without notifications of their own. Any thread may wait for the start of
// a launch to be over, for example before it writes to the child's standard input.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleApp.h"

namespace pmutil {

class StartAwareApp : public ConsoleApp {
public:
    // Launches with the platform's launcher.
    StartAwareApp();

    // Launches with `launcher`; `makeLauncher` makes another one where a launch that was given up
    // still uses it.
    explicit StartAwareApp(const boost::shared_ptr<Launcher>& launcher,
                           LauncherFactory makeLauncher = nullptr);

    // Waits up to `maxWaitSeconds` (infinity: without limit) for the end of the latest launch's
    // start: kRunning once OnRunning has returned, kFailed if the launch failed or was given up
    // before, kPending if the time ran out. kFailed at once if there is no launch: before the first
    // one, and after a Reset or a Launch that threw. Throws nothing that a launch has stored, and
    // changes no state. Any thread may call.
    consoleapp::LaunchStart::Result AwaitStart(double maxWaitSeconds);
};

} // namespace pmutil
