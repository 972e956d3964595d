#include "pmutil/StartAwareApp.h"

#include <utility>

namespace pmutil {

using consoleapp::LaunchStart;

StartAwareApp::StartAwareApp() : StartAwareApp(MakeLauncher(), MakeLauncher) {}

StartAwareApp::StartAwareApp(const boost::shared_ptr<Launcher>& launcher,
                             LauncherFactory makeLauncher)
    : ConsoleApp(launcher, std::move(makeLauncher))
{}

LaunchStart::Result StartAwareApp::AwaitStart(double maxWaitSeconds)
{
    const auto launch = GetExecutionData();
    return launch != nullptr ? launch->GetStart().Await(maxWaitSeconds)
                             : LaunchStart::Result::kFailed;
}

} // namespace pmutil
