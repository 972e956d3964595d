// A request to end a run.
#pragma once

#include <functional>
#include <mutex>

namespace assay_host {

// Any thread may call.
class StopRequest {
public:
    // A request can't be withdrawn.
    void Raise();

    bool IsRaised() const;

    // `heard` is called when the request is raised, on the thread that raises it. Replaces the
    // previous listener, which isn't called any more once this returns. May be empty.
    void SetListener(std::function<void()> heard);

private:
    mutable std::mutex fMutex;
    bool fRaised = false;
    std::function<void()> fHeard;
};

} // namespace assay_host
