#include <chrono>
#include <exception>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include "identity/Identity.h"
#include "library/Advice.h"
#include "library/Options.h"
#include "library/Session.h"
#include "library/Stop.h"
#include "library/Try.h"
#include "memory/AdviceForms.h"
#include "memory/Adviser.h"
#include "memory/Closing.h"

namespace assay_host {

namespace {

// Makes attempts for a host. This process goes on after one that failed, so that an attempt without
// an end would look like one in progress until the process ends.
class Attempts {
public:
    Attempts(const assay_host_options& options, const ChildOptions& child, assay_host_stop* stop,
             Machine& machine)
        : fOptions(options), fChild(child), fStop(stop), fMachine(machine)
    {}

    // Closes the attempt in any case, and keeps an exception.
    void Make(Attempt& attempt)
    {
        try {
            const SessionEnd end = RunSession(fOptions, fChild, fStop);
            CloseAttempt(attempt, end.fReport, end.fOutcome, fMachine.GetTime());
        } catch (...) {
            fFailure = std::current_exception();
            attempt.fEnd = AttemptEnd::kNotStarted;
        }
    }

    // Waits. Returns false if the stop is raised.
    bool Pause(double seconds) const
    {
        std::this_thread::sleep_for(std::chrono::duration<double>(seconds));
        return fStop == nullptr || !fStop->fRequest.IsRaised();
    }

    void ThrowFailure() const
    {
        if (fFailure)
            std::rethrow_exception(fFailure);
    }

private:
    const assay_host_options& fOptions;
    const ChildOptions& fChild;
    assay_host_stop* const fStop;
    Machine& fMachine;
    std::exception_ptr fFailure;
};

std::unique_ptr<assay_host_advice> Advise(const assay_host_options& options,
                                          const std::string& path, assay_host_stop* stop)
{
    const ChildOptions child = MakeChildOptions(options);
    const Identity identity = GetIdentity(child.fProgram);
    const std::unique_ptr<Folder> folder =
        OpenFolder(path, options.fDryRun ? FolderUse::kRead : FolderUse::kWrite);
    const std::unique_ptr<Machine> machine = MakeSystemMachine();
    Adviser adviser(*folder, *machine, identity, options.fRequest);
    Advice advice = adviser.Recall();
    if (!options.fDryRun && (advice.fPlan != Plan::kAnswer || advice.fIsOpen)) {
        Attempts attempts(options, child, stop, *machine);
        advice = adviser.Advise([&](Attempt& attempt) { attempts.Make(attempt); },
                                [&](double seconds) { return attempts.Pause(seconds); });
        attempts.ThrowFailure();
    }
    const int status = GetAdviceStatus(options.fRequest, advice);
    return std::make_unique<assay_host_advice>(std::move(advice), status);
}

} // namespace

} // namespace assay_host

assay_host_error assay_host_advise(const assay_host_options* options, const char* folder,
                                   assay_host_stop* stop, assay_host_advice** advice)
{
    if (advice == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    *advice = nullptr;
    if (folder == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (*folder == '\0')
        return ASSAY_HOST_BAD_TEXT;
    return assay_host::Try([&] {
        *advice =
            assay_host::Advise(options != nullptr ? *options : assay_host_options(), folder, stop)
                .release();
        return ASSAY_HOST_OK;
    });
}

void assay_host_advice_free(assay_host_advice* advice)
{
    delete advice;
}
