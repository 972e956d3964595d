// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A ConsoleApp for clients that need no notifications. Any thread may wait for the end of the
// start, for example before it writes to the child's standard input.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleApp.h"

namespace pmutil {

class StartAwareApp : public ConsoleApp {
public:
    // Uses the platform's launcher.
    StartAwareApp();

    // Uses `launcher`, or a new one of `makeLauncher` if a launch that was given up still uses it.
    explicit StartAwareApp(const boost::shared_ptr<Launcher>& launcher,
                           LauncherFactory makeLauncher = nullptr);

    // Waits up to `maxWaitSeconds` (infinity: without a limit) for the end of the latest launch's
    // start. Returns kRunning after OnRunning has returned, kFailed if the launch failed or was
    // given up before that, and kPending on timeout. Returns kFailed at once if there is no launch:
    // before the first one, and after Reset or a Launch that threw. Doesn't throw stored failures
    // and doesn't change the state. Any thread may call it.
    consoleapp::LaunchStart::Result AwaitStart(double maxWaitSeconds);
};

} // namespace pmutil
