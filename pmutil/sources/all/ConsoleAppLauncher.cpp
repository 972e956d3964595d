#include "pmutil/ConsoleAppLauncher.h"

#include <stdexcept>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "pmutil/OutputTask.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;

ConsoleAppLauncher::ConsoleAppLauncher() : ConsoleAppAccessor(TaskID::kUndefined, nullptr) {}

ConsoleAppLauncher::ConsoleAppLauncher(const ConsoleAppLauncher& other) : ConsoleAppLauncher()
{
    const boost::lock_guard<boost::mutex> lock(other.fMutex);
    AssignLocked(other);
}

ConsoleAppLauncher& ConsoleAppLauncher::operator=(const ConsoleAppLauncher& other)
{
    if (this != &other) {
        // The copy constructor locks the other, and throws if it has launched.
        // NOLINTNEXTLINE(performance-unnecessary-copy-initialization)
        const ConsoleAppLauncher copy(other);
        const boost::lock_guard<boost::mutex> lock(fMutex);
        AssignLocked(copy);
    }
    return *this;
}

ConsoleAppLauncher::~ConsoleAppLauncher() = default;

void ConsoleAppLauncher::AssignLocked(const ConsoleAppLauncher& other)
{
    RequireNotLaunched("ConsoleAppLauncher: can't assign while running");
    fTaskID = other.fTaskID;
    fExecutionData = other.fExecutionData;
    fConsoleApp = other.fConsoleApp;
    SetLaunchParams(other.fLaunchParams);
}

void ConsoleAppLauncher::RequireNotLaunched(const char* message) const
{
    if (fExecutionData != nullptr)
        throw std::runtime_error(message);
}

void ConsoleAppLauncher::RequireLaunchable() const
{
    RequireNotLaunched("ConsoleAppLauncher::Launch: already launched");
    if (fConsoleApp == nullptr)
        throw std::runtime_error("ConsoleAppLauncher: no ConsoleApp");
}

void ConsoleAppLauncher::SetLaunchParams(const LaunchParams& params)
{
    RequireNotLaunched("ConsoleAppLauncher::SetLaunchParams: already launched");
    DoSetLaunchParams(params);
}

LaunchParams ConsoleAppLauncher::GetLaunchParams() const
{
    return DoGetLaunchParams();
}

void ConsoleAppLauncher::SetConsoleApp(const boost::shared_ptr<ConsoleApp>& app)
{
    RequireNotLaunched("ConsoleAppLauncher::SetConsoleApp: already launched");
    DoSetConsoleApp(app);
}

boost::shared_ptr<ConsoleApp> ConsoleAppLauncher::GetConsoleApp() const
{
    return fConsoleApp;
}

void ConsoleAppLauncher::Launch()
{
    RequireLaunchable();
    DoLaunch();
}

State ConsoleAppLauncher::LaunchAndWait(int* exitCode, double maxWaitSeconds)
{
    RequireLaunchable();
    DoLaunch();
    return DoWait(exitCode, maxWaitSeconds);
}

State ConsoleAppLauncher::Wait(int* exitCode, double maxWaitSeconds)
{
    return DoWait(exitCode, maxWaitSeconds);
}

void ConsoleAppLauncher::Kill()
{
    DoKill();
}

void ConsoleAppLauncher::DoSetConsoleApp(const boost::shared_ptr<ConsoleApp>& app)
{
    fConsoleApp = app;
}

void ConsoleAppLauncher::DoSetLaunchParams(const LaunchParams& params)
{
    fLaunchParams = params;
}

LaunchParams ConsoleAppLauncher::DoGetLaunchParams() const
{
    return fLaunchParams;
}

void ConsoleAppLauncher::DoLaunch()
{
    fExecutionData = boost::make_shared<ExecutionData>(
        boost::weak_ptr<ConsoleApp>(fConsoleApp),
        boost::weak_ptr<OutputTask>(fLaunchParams.GetOutputTask(OutputChannel::kStdout)),
        boost::weak_ptr<OutputTask>(fLaunchParams.GetOutputTask(OutputChannel::kStderr)));
    const boost::shared_ptr<ConsoleApp> app = fExecutionData->GetConsoleApp();
    if (app == nullptr)
        throw Exception(fTaskID, "no console app");
    app->Launch(fExecutionData, fLaunchParams);
}

State ConsoleAppLauncher::DoWait(int* exitCode, double maxWaitSeconds)
{
    if (fExecutionData == nullptr)
        return State::kIdle;
    const State result = GetConsoleApp()->Wait(exitCode, maxWaitSeconds);
    if (result != State::kTimeout)
        fExecutionData.reset();
    return result;
}

void ConsoleAppLauncher::DoKill()
{
    GetConsoleApp()->Kill();
}

} // namespace pmutil
