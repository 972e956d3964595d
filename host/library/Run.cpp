#include <memory>
#include <new>
#include <string>
#include <utility>

#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "library/DefaultProgram.h"
#include "library/Options.h"
#include "library/OwnFile.h"
#include "library/Result.h"
#include "library/Try.h"
#include "report/SequenceReader.h"
#include "supervise/ChildRun.h"
#include "supervise/Containment.h"

struct assay_host_stop {
    pmutil::StopRequest fRequest;
};

namespace assay_host {

namespace {

// Collects the report and passes the events to the callbacks. A callback may end the run.
class Session : public RunObserver {
public:
    Session(const assay_host_options& options, pmutil::StopRequest& end)
        : fOptions(options), fEnd(end)
    {}

    void OnLine(const ReportLine& line, double seconds) override
    {
        fSequence.Add(line);
        fReport.Add(line);
        Call(fOptions.fOnLine, fOptions.fLineContext, line.fText, seconds);
    }

    void OnErrorLine(const std::string& line, double seconds) override
    {
        Call(fOptions.fOnErrorLine, fOptions.fErrorLineContext, line, seconds);
    }

    void OnTick(double seconds) override
    {
        if (fOptions.fOnTick != nullptr &&
            fOptions.fOnTick(fOptions.fTickContext, seconds, fSequence.GetSteps(),
                             fSequence.GetNextKey().c_str()) != 0)
            fEnd.Raise();
    }

    Report TakeReport() { return std::move(fReport); }

private:
    void Call(assay_host_line_callback callback, void* context, const std::string& line,
              double seconds)
    {
        if (callback != nullptr && callback(context, line.c_str(), line.size(), seconds) != 0)
            fEnd.Raise();
    }

    const assay_host_options& fOptions;
    pmutil::StopRequest& fEnd;
    Report fReport;
    SequenceReader fSequence;
};

std::unique_ptr<assay_host_result> Run(const assay_host_options& options, assay_host_stop* stop)
{
    KeepLoaded();
    ChildOptions child = options.fChild;
    if (child.fProgram.empty())
        child.fProgram = FindDefaultProgram();
    child.fKeepCauses = true;
    RunFacts facts;
    facts.fHostVersion = assay_host_version();
    facts.fChildVersion = GetFileVersion(child.fProgram);
    facts.fEnvironment = GetEnvironment(options.fIdentify);

    // Of this run only, since others may have the stop too.
    pmutil::StopRequest end;
    std::unique_ptr<pmutil::StopListener> listener;
    if (stop != nullptr)
        listener = std::make_unique<pmutil::StopListener>(stop->fRequest, [&end] { end.Raise(); });
    Session session(options, end);
    RunOutcome outcome =
        RunChild(child, session, end, *MakeForeignContainment(), DefaultRunTimes());
    return std::make_unique<assay_host_result>(session.TakeReport(), std::move(outcome),
                                               std::move(facts));
}

} // namespace

} // namespace assay_host

assay_host_stop* assay_host_stop_new()
{
    return new (std::nothrow) assay_host_stop;
}

void assay_host_stop_free(assay_host_stop* stop)
{
    delete stop;
}

assay_host_error assay_host_stop_raise(assay_host_stop* stop)
{
    if (stop == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    return assay_host::Try([&] {
        stop->fRequest.Raise();
        return ASSAY_HOST_OK;
    });
}

assay_host_error assay_host_run(const assay_host_options* options, assay_host_stop* stop,
                                assay_host_result** result)
{
    if (result == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    *result = nullptr;
    return assay_host::Try([&] {
        *result =
            assay_host::Run(options != nullptr ? *options : assay_host_options(), stop).release();
        return ASSAY_HOST_OK;
    });
}

void assay_host_result_free(assay_host_result* result)
{
    delete result;
}
