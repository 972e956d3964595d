// Passes events from the threads of a launch to the thread that supervises it. Holds a bounded
// number of bytes.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <mutex>
#include <optional>
#include <string>

#include "pmutil/ConsoleAppTypes.h"

namespace assay_host {

struct Event {
    enum class Kind {
        kBytes,     // the child wrote fBytes to fChannel
        kStreamEnd, // nothing more will come from fChannel
        kChildEnd   // the child has ended
    };

    Kind fKind = Kind::kBytes;
    pmutil::OutputChannel fChannel = pmutil::OutputChannel::kStdout;
    std::string fBytes;
};

// Any thread may call.
class EventQueue {
public:
    // Appends an event. Blocks while the queue is full. After Close the event is dropped.
    void Push(Event event);

    // Returns the oldest event. Waits for one up to the limit, by the steady clock; returns nothing
    // if none comes, or Wake is called.
    std::optional<Event> Pop(std::chrono::milliseconds limit);

    // Ends the wait of the current Pop, or of the next one.
    void Wake();

    // Drops all events and ends all waits. Call when no events will be popped any more.
    void Close();

private:
    std::mutex fMutex;
    std::condition_variable fCond;
    std::deque<Event> fEvents;
    std::size_t fBytes = 0;
    bool fWoken = false;
    bool fClosed = false;
};

} // namespace assay_host
