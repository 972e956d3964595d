#include <cstdio>
#include <memory>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/ValueCollector.h"
#include "output/Delivery.h"
#include "output/Output.h"
#include "output/WriterThread.h"
#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/CompareReports.h"
#include "report/DiffText.h"
#include "report/Report.h"
#include "report/ReportFile.h"
#include "report/RunOutcome.h"
#include "requirements/RequirementCheck.h"
#include "requirements/RequirementFile.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

std::vector<Requirement> GetRequirements(const CheckChoice& choice)
{
    std::vector<Requirement> requirements;
    for (const std::string& text : choice.fRequirements)
        requirements.push_back(ParseRequirement(text));
    for (const std::string& file : choice.fRequirementFiles)
        for (Requirement& requirement : LoadRequirements(file))
            requirements.push_back(std::move(requirement));
    return requirements;
}

// Writes a line for each requirement that isn't met, or one that all are.
class Checker {
public:
    explicit Checker(const CheckChoice& choice)
        : fRequirements(GetRequirements(choice)), fTolerance(choice.fTolerance)
    {
        if (!choice.fBaseline.empty())
            fBaseline = LoadReport(choice.fBaseline);
    }

    // Returns whether all are met.
    bool Check(const Report& report, const RunOutcome& outcome, const std::string& prefix)
    {
        const Answers answers = GetAnswers(report);
        bool isMet = true;
        for (const Requirement& requirement : fRequirements) {
            const std::string unmet = FindUnmet(requirement, answers, outcome);
            if (unmet.empty())
                continue;
            isMet = false;
            fText +=
                fmt::format("{}not met: {}: {}\n", prefix, ShowBytes(requirement.fText), unmet);
        }
        isMet = CheckBaseline(report, prefix) && isMet;
        if (isMet)
            fText += fmt::format("{}met: {}\n", prefix, GetWhatIsMet());
        return isMet;
    }

    void AddLine(const std::string& line) { fText += line + "\n"; }

    const std::string& GetText() const { return fText; }

private:
    bool CheckBaseline(const Report& report, const std::string& prefix)
    {
        if (!fBaseline)
            return true;
        ComparisonOptions options;
        options.fMeasurements = {fTolerance, true};
        const Comparison comparison = CompareReports(*fBaseline, report, options);
        std::stringstream lines;
        PrintDiff(lines, comparison);
        for (std::string line; std::getline(lines, line);)
            fText += fmt::format("{}not as the baseline: {}\n", prefix, line);
        return comparison.IsSame();
    }

    std::string GetWhatIsMet() const
    {
        const std::string all = fRequirements.size() == 1
                                    ? "the requirement"
                                    : fmt::format("all {} requirements", fRequirements.size());
        if (!fBaseline)
            return all;
        return fRequirements.empty() ? "the baseline" : all + " and the baseline";
    }

    const std::vector<Requirement> fRequirements;
    const double fTolerance;
    std::optional<Report> fBaseline;
    std::string fText;
};

int CheckReports(const CheckChoice& choice)
{
    Checker checker(choice);
    bool isMet = true;
    bool isRead = true;
    for (const std::string& path : choice.fReports) {
        try {
            const StoredRun run = LoadRun(path);
            const std::string prefix = choice.fReports.size() > 1 ? ShowBytes(path) + ": " : "";
            isMet = checker.Check(run.fReport, run.fOutcome, prefix) && isMet;
        } catch (const std::runtime_error& failure) {
            // The other files are checked all the same.
            std::fprintf(stderr, "assay-host: %s\n", ShowBytes(failure.what()).c_str());
            isRead = false;
        }
    }
    OpenStandardOutput()->Write(checker.GetText());
    if (!isRead)
        return kErrorStatus;
    return isMet ? 0 : kUnmetStatus;
}

int CheckRun(const CheckChoice& choice)
{
    Checker checker(choice);
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    ChildOptions options = MakeChildOptions(choice.fChild);
    options.fKeepCauses = true;
    ValueCollector collector;
    const RunOutcome outcome = RunChild(options, collector, *stop);
    const auto writer =
        std::make_shared<WriterThread>(OpenStandardOutput(), [stop] { stop->Raise(); });
    const Delivery delivery(writer);
    const bool isComplete = outcome.fVerdict == Verdict::kComplete;
    if (!isComplete)
        checker.AddLine(fmt::format("{}: {}", GetVerdictName(outcome.fVerdict), outcome.fReason));
    const bool isMet = checker.Check(collector.fReport, outcome, "");
    writer->Write(checker.GetText());
    delivery.Finish();
    if (!isComplete)
        return GetVerdictStatus(outcome.fVerdict);
    return isMet ? 0 : kUnmetStatus;
}

} // namespace

int Check(const CheckChoice& choice)
{
    return choice.fReports.empty() ? CheckRun(choice) : CheckReports(choice);
}

} // namespace assay_host
