#include <memory>
#include <ostream>
#include <utility>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "output/Delivery.h"
#include "output/Output.h"
#include "output/Terminal.h"
#include "output/WriterThread.h"
#include "report/JsonDocument.h"
#include "report/LineForm.h"
#include "report/Report.h"
#include "report/SequenceReader.h"
#include "report/TextView.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

constexpr int kFileWidth = 100;

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
    Session(const RunChoice& choice, WriterThread& writer) : fChoice(choice), fWriter(writer) {}

    void Start(const std::vector<std::string>& command)
    {
        if (fChoice.fFormat == Format::kJsonLines)
            fWriter.Write([command] { return MakeStartEvent(command); });
    }

    void OnLine(const ReportLine& line, double seconds) override
    {
        fSequence.Add(line);
        if (fChoice.fFormat == Format::kJsonLines)
            fWriter.Write([kept = ShortenLine(line), seconds] {
                return MakeLineEvent(RestoreLine(kept), seconds);
            });
        else
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
                                         next.empty() ? "at the end" : "at " + next));
    }

    void Finish(const RunOutcome& outcome)
    {
        switch (fChoice.fFormat) {
        case Format::kJsonLines:
            fWriter.Write([outcome] { return MakeEndEvent(outcome); });
            break;
        case Format::kJson:
            fWriter.WriteLarge([report = TakeReport(), outcome](std::ostream& out) {
                WriteDocument(out, *report, outcome);
            });
            break;
        case Format::kText:
            if (fChoice.fRaw)
                fWriter.Write("\n");
            const int width = fChoice.fOutput.empty() ? GetOutputWidth() : kFileWidth;
            fWriter.WriteLarge([report = TakeReport(), outcome, width](std::ostream& out) {
                PrintText(out, *report, outcome, width);
            });
        }
    }

private:
    // The writer may outlive this object.
    std::shared_ptr<const Report> TakeReport()
    {
        return std::make_shared<const Report>(std::move(fReport));
    }

    const RunChoice& fChoice;
    WriterThread& fWriter;
    Report fReport;
    SequenceReader fSequence;
};

} // namespace

int Run(const RunChoice& choice)
{
    GuardProcess();
    const auto stop = std::make_shared<StopRequest>();
    WatchForInterrupt(stop);
    const auto writer = std::make_shared<WriterThread>(
        choice.fOutput.empty() ? OpenStandardOutput() : OpenFile(choice.fOutput),
        [stop] { stop->Raise(); });
    const ChildOptions options = MakeChildOptions(choice.fChild);
    Session session(choice, *writer);
    std::vector<std::string> command = {options.fProgram};
    command.insert(command.end(), options.fArgs.begin(), options.fArgs.end());
    session.Start(command);
    const RunOutcome outcome = RunChild(options, session, *stop);
    const Delivery delivery(writer);
    session.Finish(outcome);
    delivery.Finish();
    return GetVerdictStatus(outcome.fVerdict);
}

} // namespace assay_host
