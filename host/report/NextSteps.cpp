#include "report/NextSteps.h"

#include <algorithm>
#include <cstring>

#include <fmt/format.h>

#include "report/Usable.h"

namespace assay_host {

namespace {

constexpr char kReportIt[] =
    "If the newest driver fails too, report it to the driver's developers, with the archive of "
    "assay-host bugreport.";

class StepList {
public:
    // Adds a sentence that isn't there yet.
    void Add(std::string step)
    {
        if (std::find(fSteps.begin(), fSteps.end(), step) == fSteps.end())
            fSteps.push_back(std::move(step));
    }

    std::vector<std::string> Take() { return std::move(fSteps); }

private:
    std::vector<std::string> fSteps;
};

void AddForVerdict(StepList& steps, Verdict verdict)
{
    switch (verdict) {
    case Verdict::kNeverStarted:
        steps.Add("Check that assay is installed beside assay-host or on the PATH, or name it with "
                  "--assay.");
        break;
    case Verdict::kUsageError:
        steps.Add("Correct assay's options, those after \"--\"; assay -help lists them.");
        break;
    case Verdict::kInterrupted:
        steps.Add("Run again, and let the run end by itself.");
        break;
    case Verdict::kHung:
        steps.Add("If the machine is slow or busy, run again with a longer --timeout.");
        break;
    default:
        break;
    }
}

void AddForUsable(StepList& steps, DeviceKind kind, const Usable& usable)
{
    const char* const name = GetKindName(kind);
    switch (usable.fUsability) {
    case Usability::kHardware:
        break;
    case Usability::kSoftware:
        steps.Add(
            fmt::format("If the machine has a graphics card, install its {} driver, and check "
                        "that this user may open the card.",
                        name));
        break;
    case Usability::kBroken:
        steps.Add("Update the graphics driver, or reinstall it.");
        steps.Add(kReportIt);
        break;
    case Usability::kAbsent:
        // OpenCL is often left out on purpose.
        if (kind == DeviceKind::kOpenGL)
            steps.Add(std::strcmp(usable.fReason, "no-library") == 0
                          ? "Install an OpenGL library and the graphics card's driver."
                          : "Install the graphics card's driver, and check that this user may open "
                            "the card.");
        break;
    case Usability::kUnknown:
        break;
    }
}

} // namespace

std::vector<std::string> GetNextSteps(const Answers& answers, const RunOutcome& outcome)
{
    StepList steps;
    AddForVerdict(steps, outcome.fVerdict);
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL})
        AddForUsable(steps, kind, JudgeUsable(kind, answers, outcome));
    if (outcome.fVerdict == Verdict::kCrashed || outcome.fVerdict == Verdict::kFailedTests)
        steps.Add(kReportIt);
    return steps.Take();
}

} // namespace assay_host
