#include <cstdio>
#include <memory>

#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <boost/thread/thread.hpp>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/MakeAdviceRequest.h"
#include "app/ValueCollector.h"
#include "identity/Identity.h"
#include "memory/AdviceForms.h"
#include "memory/Adviser.h"
#include "memory/Closing.h"
#include "output/Output.h"
#include "report/RunOutcome.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

// Waits and tries with the guardian and the interrupts of a run.
Advice TryWatched(Adviser& adviser, Machine& machine, const AdviseChoice& choice)
{
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    const auto run = [&](Attempt& attempt) {
        ChildOptions options = MakeChildOptions(choice.fChild);
        options.fKeepCauses = true;
        ValueCollector collector;
        const RunOutcome outcome = RunChild(options, collector, *stop);
        CloseAttempt(attempt, collector.fReport, outcome, machine.GetTime());
    };
    const auto pause = [&stop](double seconds) {
        boost::this_thread::sleep(
            boost::posix_time::microseconds(static_cast<std::int64_t>(seconds * 1e6)));
        return !stop->IsRaised();
    };
    Advice advice = adviser.Advise(run, pause);
    // The reader of the output may not read.
    SetInterruptEnd([] { EndProcess(GetVerdictStatus(Verdict::kInterrupted)); });
    return advice;
}

std::string MakeText(const Advice& advice, AdviceFormat format, int status)
{
    switch (format) {
    case AdviceFormat::kJson:
        return MakeAdviceDocument(advice, ASSAY_VERSION, status);
    case AdviceFormat::kVariables:
        return MakeAdviceVariables(advice);
    case AdviceFormat::kText:
        break;
    }
    return MakeAdviceText(advice);
}

} // namespace

int Advise(const AdviseChoice& choice)
{
    const Identity identity = GetIdentity(MakeChildOptions(choice.fChild).fProgram);
    const std::unique_ptr<Folder> folder =
        OpenFolder(choice.fState, choice.fDryRun ? FolderUse::kRead : FolderUse::kWrite);
    const std::unique_ptr<Machine> machine = MakeSystemMachine();
    const AdviceRequest request = MakeAdviceRequest(choice);
    Adviser adviser(*folder, *machine, identity, request);
    Advice advice = adviser.Recall();
    if (!choice.fDryRun && (advice.fPlan != Plan::kAnswer || advice.fIsOpen))
        advice = TryWatched(adviser, *machine, choice);
    for (const std::string& message : advice.fMessages)
        std::fprintf(stderr, "assay-host: %s\n", message.c_str());
    const int status = GetAdviceStatus(request, advice);
    OpenStandardOutput()->Write(MakeText(advice, choice.fFormat, status));
    return status;
}

} // namespace assay_host
