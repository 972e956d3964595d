// The signals of the threads that a run starts.
#pragma once

#include <memory>

namespace assay_host {

// Blocks all signals on this thread while it exists, so that threads that are started meanwhile
// never run a handler of the process. Does nothing on Windows. For one thread.
class SignalBlock {
public:
    SignalBlock();
    ~SignalBlock();
    SignalBlock(const SignalBlock&) = delete;
    SignalBlock& operator=(const SignalBlock&) = delete;

private:
    class Platform;
    const std::unique_ptr<Platform> fPlatform;
};

} // namespace assay_host
