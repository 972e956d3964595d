// Passes one stream of the child to the thread that supervises it: the function of a
// pmutil::OutputPump.
#pragma once

#include <atomic>
#include <cstdint>
#include <string_view>

#include <boost/shared_ptr.hpp>

#include "supervise/EventQueue.h"

namespace assay_host {

class StreamFeed {
public:
    // Passes on at most one block more than `maxBytes`, so that the receiver sees that there is
    // more; drops and counts the rest.
    StreamFeed(pmutil::OutputChannel channel, boost::shared_ptr<EventQueue> queue,
               std::uint64_t maxBytes);

    // Takes a block of the stream; an empty one is its end. For the thread of the pump.
    void Take(std::string_view block);

    // Returns the number of bytes dropped so far. Any thread may call.
    std::uint64_t GetDroppedByteCount() const { return fDropped; }

private:
    void Pass(std::string_view block);

    const pmutil::OutputChannel fChannel;
    const boost::shared_ptr<EventQueue> fQueue;
    const std::uint64_t fMaxBytes;
    std::uint64_t fPassed = 0;
    std::atomic<std::uint64_t> fDropped{0};
};

} // namespace assay_host
