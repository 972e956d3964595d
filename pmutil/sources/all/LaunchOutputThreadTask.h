// The function of an output thread: runs the channel's OutputTask and stores its failure.
#pragma once

#include "pmutil/ConsoleAppAccessor.h"

namespace pmutil {

class LaunchOutputThreadTask : public ConsoleAppAccessor {
public:
    LaunchOutputThreadTask(OutputChannel channel,
                           boost::shared_ptr<consoleapp::ExecutionData> data);
    LaunchOutputThreadTask(const LaunchOutputThreadTask& other) = default;
    ~LaunchOutputThreadTask() override;

    void operator()();
};

} // namespace pmutil
