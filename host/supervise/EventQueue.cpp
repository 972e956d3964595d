#include "supervise/EventQueue.h"

#include <utility>

namespace assay_host {

namespace {

constexpr std::size_t kMaxBytes = std::size_t{1} << 18;

} // namespace

void EventQueue::Push(Event event)
{
    std::unique_lock<std::mutex> lock(fMutex);
    fCond.wait(lock,
               [&] { return fClosed || fBytes == 0 || fBytes + event.fBytes.size() <= kMaxBytes; });
    if (fClosed)
        return;
    fBytes += event.fBytes.size();
    fEvents.push_back(std::move(event));
    fCond.notify_all();
}

std::optional<Event> EventQueue::Pop(std::chrono::milliseconds limit)
{
    std::unique_lock<std::mutex> lock(fMutex);
    fCond.wait_until(lock, std::chrono::steady_clock::now() + limit,
                     [this] { return fWoken || !fEvents.empty(); });
    fWoken = false;
    if (fEvents.empty())
        return std::nullopt;
    Event event = std::move(fEvents.front());
    fEvents.pop_front();
    fBytes -= event.fBytes.size();
    fCond.notify_all();
    return event;
}

void EventQueue::Wake()
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fWoken = true;
    fCond.notify_all();
}

void EventQueue::Close()
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fClosed = true;
    fEvents.clear();
    fBytes = 0;
    fCond.notify_all();
}

} // namespace assay_host
