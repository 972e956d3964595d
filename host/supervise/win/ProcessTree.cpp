#include "supervise/ProcessTree.h"

#include "supervise/win/Job.h"

namespace assay_host {

class ProcessTree::Platform {
public:
    Platform() : fJob(GetOwnJob())
    {
        if (fJob != nullptr)
            fBefore = ListProcesses(fJob);
    }

    bool EndAll(double seconds) { return fBefore && EndNewProcesses(fJob, *fBefore, seconds); }

private:
    const HANDLE fJob;
    std::optional<std::set<DWORD>> fBefore; // empty if the system doesn't report it
};

ProcessTree::ProcessTree() : fPlatform(std::make_unique<Platform>()) {}
ProcessTree::~ProcessTree() = default;

bool ProcessTree::EndAll(double seconds)
{
    return fPlatform->EndAll(seconds);
}

} // namespace assay_host
