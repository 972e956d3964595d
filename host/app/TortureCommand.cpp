#include <chrono>
#include <memory>
#include <stdexcept>
#include <utility>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "output/Delivery.h"
#include "output/Output.h"
#include "output/WriterThread.h"
#include "report/Bytes.h"
#include "report/Report.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"
#include "supervise/StepRules.h"

namespace assay_host {

namespace {

constexpr int kUnpredictedStatus = 1;

using Clock = std::chrono::steady_clock;

class Collector : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override { fReport.Add(line); }

    Report fReport;
};

std::string ShowCommand(const RunOutcome& outcome)
{
    std::string text = "  command:";
    for (const std::string& word : outcome.fCommand)
        text += " " + ShowBytes(word);
    return text + "\n";
}

class Torturer {
public:
    Torturer(const TortureChoice& choice, WriterThread& writer, pmutil::StopRequest& stop)
        : fChoice(choice), fOptions(MakeChildOptions(choice.fChild)), fWriter(writer), fStop(stop)
    {}

    int Run()
    {
        Collector undisturbed;
        fWriter.ShowProgress("an undisturbed run");
        const RunOutcome outcome = RunChild(fOptions, undisturbed, fStop);
        if (outcome.fVerdict == Verdict::kNeverStarted ||
            outcome.fVerdict == Verdict::kInterrupted) {
            Write(ShowBytes(outcome.fReason) + "\n");
            return GetVerdictStatus(outcome.fVerdict);
        }
        try {
            fRules.emplace(undisturbed.fReport, outcome);
        } catch (const std::runtime_error& error) {
            Write(fmt::format("The runs can't be predicted: {}\n{}", error.what(),
                              ShowCommand(outcome)));
            return kUnpredictedStatus;
        }
        Write(fmt::format("{} OpenGL and {} OpenCL devices, {} steps.\n", fRules->GetGLCount(),
                          fRules->HasOpenCL() ? std::to_string(fRules->GetCLCount()) : "no",
                          fRules->GetStepCount()));
        for (const StepFailure failure : fChoice.fFailures) {
            const int status = RunAll(failure);
            if (status != 0)
                return status;
        }
        Write(fmt::format("{} runs, each as predicted, in {:.1f} s.\n", fRuns,
                          std::chrono::duration<double>(Clock::now() - fStart).count()));
        return 0;
    }

private:
    int RunAll(StepFailure failure)
    {
        const std::size_t steps = fRules->GetStepCount();
        for (std::size_t step = 0; step <= steps; ++step) {
            const std::string option = fmt::format("-{}={}", GetOptionName(failure), step);
            fWriter.ShowProgress(fmt::format("{} of {}", option, steps));
            ChildOptions options = fOptions;
            options.fArgs.push_back(option);
            Collector collector;
            const RunOutcome outcome = RunChild(options, collector, fStop);
            ++fRuns;
            if (outcome.fVerdict == Verdict::kInterrupted) {
                Write(fmt::format("Interrupted at {}.\n", option));
                return GetVerdictStatus(outcome.fVerdict);
            }
            const std::string difference =
                ShowDifference(fRules->Predict(failure, step), collector.fReport, outcome);
            if (!difference.empty()) {
                Write(fmt::format("{} differs from its prediction:\n{}{}", option, difference,
                                  ShowCommand(outcome)));
                return kUnpredictedStatus;
            }
        }
        Write(fmt::format("-{}=0 to {}: as predicted.\n", GetOptionName(failure), steps));
        return 0;
    }

    void Write(std::string text) { fWriter.Write(std::move(text)); }

    const TortureChoice& fChoice;
    const ChildOptions fOptions;
    WriterThread& fWriter;
    pmutil::StopRequest& fStop;
    const Clock::time_point fStart = Clock::now();
    std::optional<StepRules> fRules;
    std::size_t fRuns = 0;
};

} // namespace

int Torture(const TortureChoice& choice)
{
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    const auto writer =
        std::make_shared<WriterThread>(OpenStandardOutput(), [stop] { stop->Raise(); });
    const int status = Torturer(choice, *writer, *stop).Run();
    Delivery(writer).Finish();
    return status;
}

} // namespace assay_host
