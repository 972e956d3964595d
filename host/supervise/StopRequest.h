// A request to end a run.
#pragma once

#include <functional>
#include <mutex>

namespace assay_host {

// Any thread may call.
class StopRequest {
public:
    // Makes the request, which can't be withdrawn, and calls the listener.
    void Raise();

    bool IsRaised() const;

    // Sets a function that Raise calls, on the thread of Raise. Replaces the previous listener,
    // which isn't called any more once this returns. May be empty. It must not call this object.
    void SetListener(std::function<void()> listener);

private:
    mutable std::mutex fMutex;
    bool fRaised = false;
    std::function<void()> fListener;
};

} // namespace assay_host
