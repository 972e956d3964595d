// Holds a run, stored reports or what is remembered to the requirements of a check, and keeps its
// lines. One thread at a time.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "app/CommandLine.h"
#include "report/Report.h"
#include "report/RunOutcome.h"
#include "requirements/RequirementCheck.h"

namespace assay_host {

class Checker {
public:
    // Parses the requirements and reads the baseline. Throws std::runtime_error for an error in
    // them.
    explicit Checker(const CheckChoice& choice);

    // Adds a line for each requirement that isn't met and for each difference to the baseline, or
    // one that all are met. Each begins with the prefix. Returns whether all are met.
    bool CheckReport(const Report& report, const RunOutcome& outcome, const std::string& prefix);

    // The same of what is remembered, without a baseline.
    bool CheckMemory(const RememberedInterface& opengl, const RememberedInterface& opencl);

    // Whether a requirement is on what can be used of this interface.
    bool RequiresUsable(DeviceKind kind) const;

    void AddLine(const std::string& line) { fText += line + "\n"; }

    // Returns all lines.
    const std::string& GetText() const { return fText; }

private:
    bool CheckAll(const std::function<std::string(const Requirement&)>& findUnmet,
                  const std::string& prefix);
    bool CheckBaseline(const Report& report, const std::string& prefix);
    std::string GetWhatIsMet() const;

    const std::vector<Requirement> fRequirements;
    const double fTolerance;
    std::optional<Report> fBaseline;
    std::string fText;
};

} // namespace assay_host
