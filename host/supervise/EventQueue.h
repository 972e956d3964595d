// Brings what the threads of a launch see to the thread that supervises it. Holds a bounded number
// of bytes: who brings more waits until some were taken.
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <optional>
#include <string>

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

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

    // The oldest event; nothing if none came within the time.
    std::optional<Event> Pop(std::chrono::milliseconds limit);

    // Nobody will take events any more.
    void Close();

private:
    boost::mutex fMutex;
    boost::condition_variable fCond;
    std::deque<Event> fEvents;
    std::size_t fBytes = 0;
    bool fClosed = false;
};

} // namespace assay_host
