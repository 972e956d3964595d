#include <cstdio>
#include <exception>
#include <sstream>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/Output.h"
#include "app/ProgressLine.h"
#include "app/Terminal.h"
#include "report/JsonDocument.h"
#include "report/Report.h"
#include "report/TextView.h"
#include "supervise/ChildRun.h"
#include "supervise/Interrupt.h"
#include "supervise/Position.h"

namespace assay_host {

namespace {

constexpr int kFileWidth = 100;

// Takes the report in, and says at once what is to be said at once.
class Session : public RunObserver {
public:
    Session(const RunChoice& choice, Output& output) : fChoice(choice), fOutput(output) {}

    void Start(const std::vector<std::string>& command)
    {
        if (fChoice.fFormat == Format::kJsonLines)
            WriteEvent(MakeStartEvent(command));
    }

    void OnLine(const ReportLine& line, double seconds) override
    {
        fPosition.Add(line);
        if (fChoice.fFormat == Format::kJsonLines)
            WriteEvent(MakeLineEvent(line, seconds));
        else
            fReport.Add(line);
        if (fChoice.fRaw)
            Write(line.fText + line.fLineEnd);
    }

    void OnErrorLine(const std::string& line, double seconds) override
    {
        if (fChoice.fFormat == Format::kJsonLines)
            WriteEvent(MakeErrorLineEvent(line, seconds));
        if (fChoice.fRaw) {
            fProgress.Clear();
            std::fprintf(stderr, "%s\n", line.c_str());
        }
    }

    void OnTick(double seconds) override
    {
        const std::string next = fPosition.GetNextKey();
        fProgress.Show(fmt::format("{:.1f} s, {} steps, {}", seconds, fPosition.GetSteps(),
                                   next.empty() ? "at the end" : "at " + next));
    }

    bool ShouldStop() override { return WasInterrupted() || fFailure != nullptr; }

    void Finish(const RunOutcome& outcome)
    {
        fProgress.Clear();
        switch (fChoice.fFormat) {
        case Format::kJsonLines:
            WriteEvent(MakeEndEvent(outcome));
            break;
        case Format::kJson:
            Write(MakeDocument(fReport, outcome).dump(2) + "\n");
            break;
        case Format::kText: {
            std::ostringstream text;
            if (fChoice.fRaw)
                text << "\n";
            PrintText(text, fReport, outcome,
                      fChoice.fOutput.empty() ? GetOutputWidth() : kFileWidth);
            Write(text.str());
        }
        }
        if (fFailure != nullptr)
            std::rethrow_exception(fFailure);
        fOutput.Finish();
    }

private:
    void WriteEvent(const nlohmann::ordered_json& event) { Write(event.dump() + "\n"); }

    // Throws only from Finish: the child must be ended before.
    void Write(const std::string& text)
    {
        if (fFailure != nullptr)
            return;
        fProgress.Clear();
        try {
            fOutput.Write(text);
        } catch (...) {
            fFailure = std::current_exception();
        }
    }

    const RunChoice& fChoice;
    Output& fOutput;
    ProgressLine fProgress;
    Report fReport;
    Position fPosition;
    std::exception_ptr fFailure;
};

} // namespace

int Run(const RunChoice& choice)
{
    const std::unique_ptr<Output> output =
        choice.fOutput.empty() ? OpenStandardOutput() : OpenFile(choice.fOutput);
    const ChildOptions options = MakeChildOptions(choice.fChild);
    WatchForInterrupt();
    Session session(choice, *output);
    std::vector<std::string> command = {options.fProgram};
    command.insert(command.end(), options.fArgs.begin(), options.fArgs.end());
    session.Start(command);
    const RunOutcome outcome = RunChild(options, session);
    session.Finish(outcome);
    return GetVerdictStatus(outcome.fVerdict);
}

} // namespace assay_host
