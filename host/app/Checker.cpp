#include "app/Checker.h"

#include <algorithm>
#include <sstream>
#include <utility>

#include <fmt/format.h>

#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/CompareReports.h"
#include "report/DiffText.h"
#include "report/ReportFile.h"
#include "requirements/RequirementFile.h"
#include "series/MedianReport.h"

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

} // namespace

Checker::Checker(const CheckChoice& choice)
    : fRequirements(GetRequirements(choice)), fTolerance(choice.fTolerance)
{
    if (!choice.fBaseline.empty())
        fBaseline = GetTypicalReport(LoadRun(choice.fBaseline));
}

bool Checker::CheckReport(const Report& report, const RunOutcome& outcome,
                          const std::string& prefix)
{
    const Answers answers = GetAnswers(report);
    bool isMet = CheckAll(
        [&](const Requirement& requirement) { return FindUnmet(requirement, answers, outcome); },
        prefix);
    isMet = CheckBaseline(report, prefix) && isMet;
    if (isMet)
        AddLine(fmt::format("{}met: {}", prefix, GetWhatIsMet()));
    return isMet;
}

bool Checker::CheckMemory(const RememberedInterface& opengl, const RememberedInterface& opencl)
{
    const bool isMet = CheckAll(
        [&](const Requirement& requirement) {
            return FindUnmetInMemory(requirement, opengl, opencl);
        },
        "");
    if (isMet)
        AddLine("met: " + GetWhatIsMet());
    return isMet;
}

bool Checker::RequiresUsable(DeviceKind kind) const
{
    return std::any_of(
        fRequirements.begin(), fRequirements.end(), [kind](const Requirement& requirement) {
            const auto* const fact = std::get_if<FactOf>(&requirement.fSubject);
            return fact != nullptr && fact->fFact == InterfaceFact::kUsable && fact->fKind == kind;
        });
}

bool Checker::CheckAll(const std::function<std::string(const Requirement&)>& findUnmet,
                       const std::string& prefix)
{
    bool isMet = true;
    for (const Requirement& requirement : fRequirements) {
        const std::string unmet = findUnmet(requirement);
        if (unmet.empty())
            continue;
        isMet = false;
        AddLine(fmt::format("{}not met: {}: {}", prefix, ShowBytes(requirement.fText), unmet));
    }
    return isMet;
}

bool Checker::CheckBaseline(const Report& report, const std::string& prefix)
{
    if (!fBaseline)
        return true;
    ComparisonOptions options;
    options.fMeasurements = {fTolerance, true};
    const Comparison comparison = CompareReports(*fBaseline, report, options);
    std::stringstream lines;
    PrintDiff(lines, comparison);
    for (std::string line; std::getline(lines, line);)
        AddLine(fmt::format("{}not as the baseline: {}", prefix, line));
    return comparison.IsSame();
}

std::string Checker::GetWhatIsMet() const
{
    std::string all = fRequirements.size() == 1
                          ? "the requirement"
                          : fmt::format("all {} requirements", fRequirements.size());
    if (!fBaseline)
        return all;
    return fRequirements.empty() ? "the baseline" : all + " and the baseline";
}

} // namespace assay_host
