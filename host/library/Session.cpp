#include "library/Session.h"

#include <memory>
#include <string>
#include <utility>

#include "library/DefaultProgram.h"
#include "library/OwnFile.h"
#include "library/Stop.h"
#include "report/SequenceReader.h"
#include "supervise/Containment.h"

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

} // namespace

ChildOptions MakeChildOptions(const assay_host_options& options)
{
    ChildOptions child = options.fChild;
    if (child.fProgram.empty())
        child.fProgram = FindDefaultProgram();
    child.fKeepCauses = true;
    return child;
}

SessionEnd RunSession(const assay_host_options& options, const ChildOptions& child,
                      assay_host_stop* stop)
{
    KeepLoaded();
    // Of this run only, since others may have the stop too.
    pmutil::StopRequest end;
    std::unique_ptr<pmutil::StopListener> listener;
    if (stop != nullptr)
        listener = std::make_unique<pmutil::StopListener>(stop->fRequest, [&end] { end.Raise(); });
    Session session(options, end);
    RunOutcome outcome =
        RunChild(child, session, end, *MakeForeignContainment(), DefaultRunTimes());
    return {session.TakeReport(), std::move(outcome)};
}

} // namespace assay_host
