#include <chrono>
#include <stdexcept>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/Output.h"
#include "app/ProgressLine.h"
#include "report/Report.h"
#include "supervise/ChildRun.h"
#include "supervise/Interrupt.h"
#include "supervise/StepRules.h"

namespace assay_host {

namespace {

constexpr int kUnpredictedStatus = 1;

using Clock = std::chrono::steady_clock;

class Collector : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override { fReport.Add(line); }
    bool ShouldStop() override { return WasInterrupted(); }

    Report fReport;
};

std::string ShowCommand(const RunOutcome& outcome)
{
    std::string text = "  command:";
    for (const std::string& word : outcome.fCommand)
        text += " " + word;
    return text + "\n";
}

class Torturer {
public:
    explicit Torturer(const TortureChoice& choice)
        : fChoice(choice), fOptions(MakeChildOptions(choice.fChild))
    {}

    int Run()
    {
        Collector undisturbed;
        fProgress.Show("an undisturbed run");
        const RunOutcome outcome = RunChild(fOptions, undisturbed);
        if (outcome.fVerdict == Verdict::kNeverStarted ||
            outcome.fVerdict == Verdict::kInterrupted) {
            Say(outcome.fReason + "\n");
            return GetVerdictStatus(outcome.fVerdict);
        }
        try {
            fRules.emplace(undisturbed.fReport, outcome);
        } catch (const std::runtime_error& error) {
            Say(fmt::format("Nothing can be predicted: {}\n{}", error.what(),
                            ShowCommand(outcome)));
            return kUnpredictedStatus;
        }
        Say(fmt::format("{} OpenGL and {} OpenCL devices, {} steps.\n", fRules->GetGLCount(),
                        fRules->HasOpenCL() ? std::to_string(fRules->GetCLCount()) : "no",
                        fRules->GetStepCount()));
        for (const StepFailure failure : fChoice.fFailures) {
            const int status = RunAll(failure);
            if (status != 0)
                return status;
        }
        Say(fmt::format("{} runs, each as predicted, in {:.1f} s.\n", fRuns,
                        std::chrono::duration<double>(Clock::now() - fStart).count()));
        return 0;
    }

private:
    int RunAll(StepFailure failure)
    {
        const std::size_t steps = fRules->GetStepCount();
        for (std::size_t step = 0; step <= steps; ++step) {
            const std::string option = fmt::format("-{}={}", GetOptionName(failure), step);
            fProgress.Show(fmt::format("{} of {}", option, steps));
            ChildOptions options = fOptions;
            options.fArgs.push_back(option);
            Collector collector;
            const RunOutcome outcome = RunChild(options, collector);
            ++fRuns;
            if (outcome.fVerdict == Verdict::kInterrupted) {
                Say(fmt::format("Interrupted at {}.\n", option));
                return GetVerdictStatus(outcome.fVerdict);
            }
            const std::string difference =
                ShowDifference(fRules->Predict(failure, step), collector.fReport, outcome);
            if (!difference.empty()) {
                Say(fmt::format("{} is not what the rules predict:\n{}{}", option, difference,
                                ShowCommand(outcome)));
                return kUnpredictedStatus;
            }
        }
        Say(fmt::format("-{}=0 to {}: as predicted.\n", GetOptionName(failure), steps));
        return 0;
    }

    void Say(const std::string& text)
    {
        fProgress.Clear();
        fOutput->Write(text);
    }

    const TortureChoice& fChoice;
    const ChildOptions fOptions;
    const std::unique_ptr<Output> fOutput = OpenStandardOutput();
    const Clock::time_point fStart = Clock::now();
    ProgressLine fProgress;
    std::optional<StepRules> fRules;
    std::size_t fRuns = 0;
};

} // namespace

int Torture(const TortureChoice& choice)
{
    WatchForInterrupt();
    return Torturer(choice).Run();
}

} // namespace assay_host
