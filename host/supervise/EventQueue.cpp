#include "supervise/EventQueue.h"

#include <utility>

#include <boost/thread/lock_guard.hpp>

namespace assay_host {

namespace {

constexpr std::size_t kMaxBytes = std::size_t{1} << 18;

} // namespace

void EventQueue::Push(Event event)
{
    boost::unique_lock<boost::mutex> lock(fMutex);
    while (!fClosed && fBytes > 0 && fBytes + event.fBytes.size() > kMaxBytes)
        fCond.wait(lock);
    if (fClosed)
        return;
    fBytes += event.fBytes.size();
    fEvents.push_back(std::move(event));
    fCond.notify_all();
}

std::optional<Event> EventQueue::Pop(std::chrono::milliseconds limit)
{
    boost::unique_lock<boost::mutex> lock(fMutex);
    const boost::system_time deadline =
        boost::get_system_time() + boost::posix_time::milliseconds(limit.count());
    while (fEvents.empty()) {
        if (!fCond.timed_wait(lock, deadline) && fEvents.empty())
            return std::nullopt;
    }
    Event event = std::move(fEvents.front());
    fEvents.pop_front();
    fBytes -= event.fBytes.size();
    fCond.notify_all();
    return event;
}

void EventQueue::Close()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fClosed = true;
    fEvents.clear();
    fBytes = 0;
    fCond.notify_all();
}

} // namespace assay_host
