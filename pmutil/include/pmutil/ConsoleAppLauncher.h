// The client's way to launch a console program: gathers the application and what to launch, and
// drives the launch. Used from the client's thread.
//
//     ConsoleAppLauncher launcher;
//     launcher.SetConsoleApp(boost::make_shared<ConsoleApp>());
//     launcher.SetLaunchParams(LaunchParams(stdoutTask, stderrTask, {"-x"}, L"/usr/bin/thing"));
//     int exitCode = 0;
//     if (launcher.LaunchAndWait(&exitCode, 10.0) == State::kTimeout)
//         launcher.Kill();
//
// A launcher that launched and was not waited for until the end can't be copied or changed.
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
    // "ConsoleAppLauncher: no ConsoleApp", and what ConsoleApp::Launch throws; after that it counts
    // as launched until Wait, which answers Idle.
    void Launch();

    // As ConsoleApp's, but Idle before a launch. Any result but Timeout makes this object ready for
    // the next launch.
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
