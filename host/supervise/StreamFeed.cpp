#include "supervise/StreamFeed.h"

#include <string>
#include <utility>

namespace assay_host {

StreamFeed::StreamFeed(pmutil::OutputChannel channel, boost::shared_ptr<EventQueue> queue,
                       std::uint64_t maxBytes)
    : fChannel(channel), fQueue(std::move(queue)), fMaxBytes(maxBytes)
{}

void StreamFeed::Take(std::string_view block)
{
    try {
        if (!block.empty())
            return Pass(block);
    } catch (...) {
        fQueue->Push({Event::Kind::kStreamEnd, fChannel, {}});
        throw;
    }
    fQueue->Push({Event::Kind::kStreamEnd, fChannel, {}});
}

void StreamFeed::Pass(std::string_view block)
{
    if (fPassed > fMaxBytes) {
        fDropped += block.size();
        return;
    }
    fPassed += block.size();
    fQueue->Push({Event::Kind::kBytes, fChannel, std::string(block)});
}

} // namespace assay_host
