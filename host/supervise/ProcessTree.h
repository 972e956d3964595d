// The processes that a supervised child leaves behind.
#pragma once

#include <memory>

namespace assay_host {

// From its construction on, keeps track of the descendants of this process. Children that existed
// before are excluded; construct it while no launch is in progress. One thread at a time.
class ProcessTree {
public:
    ProcessTree();
    ~ProcessTree();
    ProcessTree(const ProcessTree&) = delete;
    ProcessTree& operator=(const ProcessTree&) = delete;

    // Kills all descendants that were started since the construction. Call after the children
    // themselves have ended. Returns false if some are left after this time, by the system's clock,
    // or if the system doesn't report them.
    bool EndAll(double seconds);

private:
    class Platform;
    std::unique_ptr<Platform> fPlatform;
};

} // namespace assay_host
