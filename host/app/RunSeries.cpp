#include "app/RunSeries.h"

#include <chrono>
#include <utility>

#include <fmt/format.h>

#include "app/NeedStatus.h"
#include "app/RunParts.h"
#include "facts/DescribeFiles.h"
#include "output/Delivery.h"
#include "report/Activity.h"
#include "report/SequenceReader.h"
#include "series/SeriesCollector.h"
#include "series/SeriesPlanning.h"
#include "supervise/RunTimes.h"

namespace assay_host {

namespace {

// Collects the report of one run, and shows the progress of the series.
class OneRun : public RunObserver {
public:
    OneRun(const RunChoice& choice, WriterThread& writer, std::size_t runsBefore,
           double secondsBefore)
        : fChoice(choice), fWriter(writer), fRunsBefore(runsBefore), fSecondsBefore(secondsBefore)
    {}

    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        fSequence.Add(line);
        fReport.Add(line);
        if (fChoice.fRaw)
            fWriter.Write(line.fText + line.fLineEnd);
    }

    void OnErrorLine(const std::string& line, double /*seconds*/) override
    {
        if (fChoice.fRaw)
            fWriter.WriteError(line + "\n");
    }

    void OnTick(double seconds) override
    {
        const std::string next = fSequence.GetNextKey();
        fWriter.ShowProgress(fmt::format(
            "{}; {}",
            GetProgressText(fChoice.fSeries, fRunsBefore, fSecondsBefore + seconds, seconds),
            next.empty() ? "at the end" : GetActivityText(next)));
    }

    Report TakeReport() { return std::move(fReport); }

private:
    const RunChoice& fChoice;
    WriterThread& fWriter;
    const std::size_t fRunsBefore;
    const double fSecondsBefore;
    Report fReport;
    SequenceReader fSequence;
};

bool CannotRun(Verdict verdict)
{
    return verdict == Verdict::kNeverStarted || verdict == Verdict::kUsageError;
}

StoredRun RunAll(const RunChoice& choice, const ChildOptions& options, WriterThread& writer,
                 pmutil::StopRequest& stop)
{
    const auto readClock = DefaultRunTimes().fNow;
    const RunTimes::Clock::time_point start = readClock();
    const auto getSeconds = [&] { return RunTimes::Seconds(readClock() - start).count(); };
    SeriesCollector series(choice.fSeries);
    while (true) {
        OneRun run(choice, writer, series.GetRunCount(), getSeconds());
        RunOutcome outcome = RunChild(options, run, stop);
        const Verdict verdict = outcome.fVerdict;
        series.Add(run.TakeReport(), std::move(outcome));
        const double seconds = getSeconds();
        if (verdict == Verdict::kInterrupted)
            return series.Finish(SeriesEnd::kInterrupted, seconds);
        if (IsOver(choice.fSeries, series.GetRunCount(), seconds))
            return series.Finish(SeriesEnd::kDone, seconds);
        if (CannotRun(verdict))
            return series.Finish(SeriesEnd::kGivenUp, seconds);
        if (series.IsFull())
            return series.Finish(SeriesEnd::kFull, seconds);
        if (stop.IsRaised())
            return series.Finish(SeriesEnd::kInterrupted, seconds);
    }
}

} // namespace

int RunSeries(const RunChoice& choice, const ChildOptions& options,
              const std::shared_ptr<WriterThread>& writer, pmutil::StopRequest& stop)
{
    RunFacts facts = MakeRunFacts(choice, options.fProgram);
    StoredRun run = RunAll(choice, options, *writer, stop);
    run.fFacts = std::move(facts);
    if (choice.fFormat == Format::kJson)
        DescribeFiles(run.fOutcome.fDrivers.fFiles);
    const int status =
        choice.fNeed == Need::kNothing
            ? GetVerdictStatus(run.fOutcome.fVerdict)
            : GetNeedStatus(choice.fNeed, run.fSeries->fOpenGL, run.fSeries->fOpenCL);
    const Delivery delivery(writer);
    if (choice.fRaw)
        writer->Write("\n");
    WriteRun(*writer, choice, std::move(run));
    delivery.Finish();
    return status;
}

} // namespace assay_host
