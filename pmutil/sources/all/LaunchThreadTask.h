// The function of the launcher's thread: runs a launch from start to end.
#pragma once

#include "pmutil/ConsoleAppAccessor.h"
#include "pmutil/Launcher.h"
#include "pmutil/ManagedThread.h"

namespace pmutil {

class LaunchThreadTask : public ConsoleAppAccessor {
public:
    LaunchThreadTask(boost::shared_ptr<consoleapp::ExecutionData> data,
                     boost::shared_ptr<Launcher> launcher, LaunchParams params);
    LaunchThreadTask(const LaunchThreadTask& other) = default;
    ~LaunchThreadTask() override;

    void operator()();

private:
    using Threads = ManagedThread[kOutputSlots];

    void RunLaunch(bool& mustKill, LaunchResult& result, Threads& threads);
    void StartOutputTask(OutputChannel channel,
                         const boost::shared_ptr<consoleapp::ExecutionData>& data,
                         const boost::shared_ptr<Reader>& reader, ManagedThread& thread);
    void EndStart();
    void CleanupLaunchThreadTask(bool mustKill, LaunchResult& result, Threads& threads);

    boost::shared_ptr<Launcher> fLauncher;
    LaunchParams fLaunchParams;
};

} // namespace pmutil
