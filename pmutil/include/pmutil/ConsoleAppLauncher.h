// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Launches a console program for a client: holds the application and the parameters of the launch.
// Use it on the client's thread.
//
//     ConsoleAppLauncher launcher;
//     launcher.SetConsoleApp(boost::make_shared<ConsoleApp>());
//     launcher.SetLaunchParams(LaunchParams(stdoutTask, stderrTask, {"-x"}, L"/usr/bin/thing"));
//     int exitCode = 0;
//     if (launcher.LaunchAndWait(&exitCode, 10.0) == State::kTimeout)
//         launcher.Kill();
//
// After a launch, it can't be copied or changed until a Wait has returned the end of the child.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleAppAccessor.h"

namespace pmutil {

class ConsoleAppLauncher : public ConsoleAppAccessor {
public:
    ConsoleAppLauncher();

    // Throw std::runtime_error "ConsoleAppLauncher::SetLaunchParams: already launched" if `other`
    // has launched, assignment also "ConsoleAppLauncher: can't assign while running" if this one
    // has.
    ConsoleAppLauncher(const ConsoleAppLauncher& other);
    ConsoleAppLauncher& operator=(const ConsoleAppLauncher& other);
    ~ConsoleAppLauncher() override;

    // Throws std::runtime_error "ConsoleAppLauncher::SetLaunchParams: already launched".
    void SetLaunchParams(const LaunchParams& params);
    LaunchParams GetLaunchParams() const;

    // Throws std::runtime_error "ConsoleAppLauncher::SetConsoleApp: already launched".
    void SetConsoleApp(const boost::shared_ptr<ConsoleApp>& app);
    boost::shared_ptr<ConsoleApp> GetConsoleApp() const;

    // Throws std::runtime_error "ConsoleAppLauncher::Launch: already launched" and
    // "ConsoleAppLauncher: no ConsoleApp", and the failures of ConsoleApp::Launch; after the latter
    // the object counts as launched until Wait, which returns Idle.
    void Launch();

    // As those of ConsoleApp; Wait returns Idle before a launch. After any result but Timeout the
    // object can launch again.
    State Wait(int* exitCode, double maxWaitSeconds);
    State LaunchAndWait(int* exitCode, double maxWaitSeconds);
    void Kill();

protected:
    virtual void DoSetConsoleApp(const boost::shared_ptr<ConsoleApp>& app);
    virtual void DoSetLaunchParams(const LaunchParams& params);
    virtual LaunchParams DoGetLaunchParams() const;
    virtual void DoLaunch();
    virtual State DoWait(int* exitCode, double maxWaitSeconds);
    virtual void DoKill();

private:
    void AssignLocked(const ConsoleAppLauncher& other);
    void RequireNotLaunched(const char* message) const;
    void RequireLaunchable() const;

    boost::shared_ptr<ConsoleApp> fConsoleApp;
    LaunchParams fLaunchParams;
};

} // namespace pmutil
