#include "supervise/PumpTask.h"

#include <utility>
#include <vector>

namespace assay_host {

namespace {

constexpr std::size_t kBlockBytes = std::size_t{1} << 16;

} // namespace

PumpTask::PumpTask(pmutil::OutputChannel channel, boost::weak_ptr<SupervisedApp> app,
                   boost::shared_ptr<EventQueue> queue, std::uint64_t maxBytes)
    : fChannel(channel), fApp(std::move(app)), fQueue(std::move(queue)), fMaxBytes(maxBytes)
{}

void PumpTask::DoRun()
{
    try {
        Pump();
    } catch (...) {
        fQueue->Push({Event::Kind::kStreamEnd, fChannel, {}});
        throw;
    }
    fQueue->Push({Event::Kind::kStreamEnd, fChannel, {}});
    if (const auto app = fApp.lock())
        app->AwaitRunning();
}

void PumpTask::Pump()
{
    const boost::shared_ptr<pmutil::Reader> reader = GetReader();
    std::vector<char> block(kBlockBytes);
    std::uint64_t passed = 0;
    for (;;) {
        const std::uint64_t count = reader->ReadSome(block.data(), block.size());
        if (count == 0)
            return;
        if (passed > fMaxBytes) {
            fDropped += count;
        } else {
            passed += count;
            fQueue->Push({Event::Kind::kBytes, fChannel,
                          std::string(block.data(), static_cast<std::size_t>(count))});
        }
    }
}

} // namespace assay_host
