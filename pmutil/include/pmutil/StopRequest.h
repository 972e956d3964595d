// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A request to end an operation, such as the run of a child. Any thread may use it.
#pragma once

#include <functional>
#include <list>

#include <boost/thread/mutex.hpp>

namespace pmutil {

class StopRequest {
public:
    StopRequest() = default;
    StopRequest(const StopRequest&) = delete;
    StopRequest& operator=(const StopRequest&) = delete;

    // Makes the request, which can't be withdrawn, and calls all listeners. A second call calls
    // them again.
    void Raise();

    bool IsRaised() const;

private:
    friend class StopListener;
    using Listeners = std::list<std::function<void()>>;

    mutable boost::mutex fMutex;
    bool fRaised = false;
    Listeners fListeners;
};

// Registers a listener with a request for as long as this object lives.
class StopListener {
public:
    // `listener` is called by each Raise, on the thread of Raise, and by this constructor if the
    // request was raised before. It must not block, throw, or call the request.
    StopListener(StopRequest& stop, std::function<void()> listener);

    // The listener isn't called any more once this returns.
    ~StopListener();
    StopListener(const StopListener&) = delete;
    StopListener& operator=(const StopListener&) = delete;

private:
    StopRequest& fStop;
    StopRequest::Listeners::iterator fPlace;
};

} // namespace pmutil
