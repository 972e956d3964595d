// Reads one stream of the child to its end, whatever the supervising thread does with the bytes.
#pragma once

#include <atomic>
#include <cstdint>

#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>

#include "pmutil/OutputTask.h"
#include "supervise/EventQueue.h"
#include "supervise/SupervisedApp.h"

namespace assay_host {

class PumpTask : public pmutil::OutputTask {
public:
    // Passes on a little more than `maxBytes`, so that the receiver sees that there is more; drops
    // and counts the rest.
    PumpTask(pmutil::OutputChannel channel, boost::weak_ptr<SupervisedApp> app,
             boost::shared_ptr<EventQueue> queue, std::uint64_t maxBytes);

    std::uint64_t GetDroppedByteCount() const { return fDropped; }

protected:
    void DoRun() override;

private:
    void Pump();

    const pmutil::OutputChannel fChannel;
    const boost::weak_ptr<SupervisedApp> fApp;
    const boost::shared_ptr<EventQueue> fQueue;
    const std::uint64_t fMaxBytes;
    std::atomic<std::uint64_t> fDropped{0};
};

} // namespace assay_host
