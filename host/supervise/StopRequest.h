// The wish that a run comes to its end.
#pragma once

#include <functional>
#include <mutex>

namespace assay_host {

// Any thread may call.
class StopRequest {
public:
    // For good: a request isn't taken back.
    void Raise();

    bool IsRaised() const;

    // `heard` is called when the request is raised, on the thread that raises it. It takes the
    // place of the one before, which isn't called any more once this returns; an empty one only
    // does that.
    void SetListener(std::function<void()> heard);

private:
    mutable std::mutex fMutex;
    bool fRaised = false;
    std::function<void()> fHeard;
};

} // namespace assay_host
