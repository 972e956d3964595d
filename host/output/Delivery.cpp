#include "output/Delivery.h"

#include <chrono>
#include <optional>
#include <utility>

#include "report/RunOutcome.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"
#include "supervise/RunTimes.h"

namespace assay_host {

namespace {

[[noreturn]] void GiveUp(WriterThread& writer)
{
    writer.Abandon();
    EndUnguarded();
    EndProcess(GetVerdictStatus(Verdict::kInterrupted));
}

} // namespace

Delivery::Delivery(std::shared_ptr<WriterThread> writer)
    : fWriter(std::move(writer)),
      fInterrupts(SetInterruptEnd([shared = fWriter] { GiveUp(*shared); }))
{}

Delivery::~Delivery()
{
    EndUnguarded();
}

void Delivery::Finish() const
{
    std::optional<std::chrono::milliseconds> patience;
    if (fInterrupts > 0)
        patience =
            fInterrupts == 1 ? DefaultRunTimes().fReaderPatience : std::chrono::milliseconds(0);
    if (!fWriter->Finish(patience))
        GiveUp(*fWriter);
}

} // namespace assay_host
