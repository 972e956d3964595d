#include <memory>
#include <ostream>
#include <utility>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/Forms.h"
#include "app/RunParts.h"
#include "app/RunSeries.h"
#include "facts/DescribeFiles.h"
#include "output/Delivery.h"
#include "output/Output.h"
#include "output/Terminal.h"
#include "output/WriterThread.h"
#include "report/Activity.h"
#include "report/JsonDocument.h"
#include "report/JsonEvents.h"
#include "report/LineForm.h"
#include "report/Report.h"
#include "report/SequenceReader.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

// Returns the line without its key and value, which RestoreLine reads from the text again. Saves
// memory while the line waits to be written.
ReportLine ShortenLine(const ReportLine& line)
{
    ReportLine kept;
    kept.fKind = line.fKind;
    kept.fText = line.fText;
    kept.fLineEnd = line.fLineEnd;
    kept.fCut = line.fCut;
    return kept;
}

ReportLine RestoreLine(const ReportLine& kept)
{
    if (kept.fKind != LineKind::kValue)
        return kept;
    return ReadLine(kept.fText, kept.fLineEnd, kept.fCut);
}

// Collects the report, and passes lines and events to the writer at once.
class Session : public RunObserver {
public:
    Session(const RunChoice& choice, const std::string& program, WriterThread& writer)
        : fChoice(choice), fWriter(writer), fFacts(MakeRunFacts(choice, program))
    {}

    void Start(const std::vector<std::string>& command)
    {
        if (fChoice.fFormat != Format::kJsonLines)
            return;
        if (fChoice.fSchema == kFirstSchemaVersion)
            fWriter.Write([command] { return MakeFirstStartEvent(command); });
        else
            fWriter.Write([command, facts = fFacts] { return MakeStartEvent(command, facts); });
    }

    void OnLine(const ReportLine& line, double seconds) override
    {
        fSequence.Add(line);
        if (fChoice.fFormat == Format::kJsonLines)
            fWriter.Write([kept = ShortenLine(line), seconds] {
                return MakeLineEvent(RestoreLine(kept), seconds);
            });
        // The answers need only the values; all lines are already with the writer.
        if (fChoice.fFormat != Format::kJsonLines || line.fKind == LineKind::kValue)
            fReport.Add(line);
        if (fChoice.fRaw)
            fWriter.Write(line.fText + line.fLineEnd);
    }

    void OnErrorLine(const std::string& line, double seconds) override
    {
        if (fChoice.fFormat == Format::kJsonLines)
            fWriter.Write([line, seconds] { return MakeErrorLineEvent(line, seconds); });
        if (fChoice.fRaw)
            fWriter.WriteError(line + "\n");
    }

    void OnTick(double seconds) override
    {
        const std::string next = fSequence.GetNextKey();
        fWriter.ShowProgress(fmt::format("{:.1f} s, {} steps, {}", seconds, fSequence.GetSteps(),
                                         next.empty() ? "at the end" : GetActivityText(next)));
    }

    // Queues the rest of the output, and returns the exit status.
    int Finish(const RunOutcome& outcome)
    {
        const int status = GetRunStatus(fChoice.fNeed, fReport, outcome);
        const bool isFirst = fChoice.fSchema == kFirstSchemaVersion;
        if (fChoice.fFormat == Format::kJsonLines) {
            const auto report = std::make_shared<const Report>(std::move(fReport));
            fWriter.Write([report, outcome, isFirst] {
                return isFirst ? MakeFirstEndEvent(outcome)
                               : MakeEndEvent(GetAnswers(*report), outcome);
            });
            return status;
        }
        if (fChoice.fRaw)
            fWriter.Write("\n");
        StoredRun run;
        run.fReport = std::move(fReport);
        run.fOutcome = outcome;
        run.fFacts = fFacts;
        WriteRun(fWriter, fChoice, std::move(run));
        return status;
    }

private:
    const RunChoice& fChoice;
    WriterThread& fWriter;
    const RunFacts fFacts;
    Report fReport;
    SequenceReader fSequence;
};

} // namespace

int Run(const RunChoice& choice)
{
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    const auto writer = std::make_shared<WriterThread>(
        choice.fOutput.empty() ? OpenStandardOutput() : OpenFile(choice.fOutput),
        [stop] { stop->Raise(); });
    ChildOptions options = MakeChildOptions(choice.fChild);
    options.fKeepCauses = true;
    if (choice.fSeries.IsAsked())
        return RunSeries(choice, options, writer, *stop);
    Session session(choice, options.fProgram, *writer);
    std::vector<std::string> command = {options.fProgram};
    command.insert(command.end(), options.fArgs.begin(), options.fArgs.end());
    session.Start(command);
    RunOutcome outcome = RunChild(options, session, *stop);
    if (choice.fFormat == Format::kJson || choice.fFormat == Format::kJsonLines)
        DescribeFiles(outcome.fDrivers.fFiles);
    const Delivery delivery(writer);
    const int status = session.Finish(outcome);
    delivery.Finish();
    return status;
}

} // namespace assay_host
