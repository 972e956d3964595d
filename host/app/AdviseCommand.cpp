#include <cstdio>
#include <memory>

#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <boost/thread/thread.hpp>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/PolicyTime.h"
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

AdviceRequest MakeRequest(const AdviseChoice& choice)
{
    AdviceRequest request;
    request.fNeedsOpenGL = choice.fNeed != Need::kOpenCL;
    request.fNeedsOpenCL = choice.fNeed != Need::kOpenGL;
    request.fFresh = choice.fFresh;
    request.fWaitSeconds = choice.fWaitSeconds;
    request.fPolicy.fMaxAge = ToSeconds(choice.fMaxAgeDays, Policy::kDay);
    request.fPolicy.fFirstPause = ToSeconds(choice.fPauseSeconds, 1);
    request.fPolicy.fRetries = choice.fRetries;
    request.fPolicy.fForgiven = ToSeconds(choice.fForgiveDays, Policy::kDay);
    request.fPolicy.fAbsentKept = ToSeconds(choice.fKeepAbsentSeconds, 1);
    request.fPolicy.fUnknownKept = ToSeconds(choice.fKeepUnknownSeconds, 1);
    request.fPolicy.fPauseGrowth = choice.fPauseGrowth;
    request.fPolicy.fFreezeForgiven = ToSeconds(choice.fForgiveFreezeDays, Policy::kDay);
    request.fPolicy.fMaxUnclear = choice.fUnclear;
    request.fPolicy.fUnclearPause = ToSeconds(choice.fUnclearPauseSeconds, 1);
    return request;
}

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
    const AdviceRequest request = MakeRequest(choice);
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
