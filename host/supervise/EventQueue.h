// Brings what the threads of a launch see to the thread that supervises it. Holds a bounded number
// of bytes: who brings more waits until some were taken.
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
    // Waits while too many bytes are held. After Close it drops the event.
    void Push(Event event);

    // The oldest event; nothing if none came within the limit (of the steady clock) or before a
    // Wake.
    std::optional<Event> Pop(std::chrono::milliseconds limit);

    // Ends the wait of the current Pop, else of the next one.
    void Wake();

    // Nobody will take events any more.
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
