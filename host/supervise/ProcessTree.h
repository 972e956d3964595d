// What a supervised child leaves behind: processes that it started and that go on without it.
#pragma once

#include <memory>

namespace assay_host {

// From its construction on, what the children of this process leave behind stays in reach. Children
// that this process has had before are left alone; make it when no other launch is under way.
class ProcessTree {
public:
    ProcessTree();
    ~ProcessTree();
    ProcessTree(const ProcessTree&) = delete;
    ProcessTree& operator=(const ProcessTree&) = delete;

    // Ends by force whatever descends from the children since, which themselves have ended. False
    // if something is left after so many seconds, or the system doesn't report it.
    bool EndAll(double seconds);

private:
    class Platform;
    std::unique_ptr<Platform> fPlatform;
};

} // namespace assay_host
