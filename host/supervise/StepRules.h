// Predicts the output of a child that is made to fail at a step, by the rules of
// docs/report-format.md and an undisturbed run on the same machine.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "report/KnownKeys.h"
#include "report/Report.h"
#include "report/RunOutcome.h"
#include "report/SequenceReader.h"

namespace assay_host {

enum class StepFailure {
    kNone,
    kCrash, // -crashAfter=N: every step from N on
    kThrow  // -throwAfter=N: exactly step N
};

// Returns "crashAfter" or "throwAfter".
const char* GetOptionName(StepFailure failure);

struct ExpectedLine {
    std::string fText; // of the undisturbed run
    Match fMatch = Match::kExact;

    // Whether a line without its end is as expected.
    bool Matches(const std::string& text) const;
};

struct Prediction {
    std::vector<ExpectedLine> fLines; // without comments
    std::vector<std::string> fErrors; // the child's own messages on standard error
    int fStatus = 0;
};

// Constant after construction: any thread may call.
class StepRules {
public:
    // Takes an undisturbed run. Throws std::runtime_error that names the difference if the run
    // didn't complete or doesn't follow the rules itself.
    StepRules(const Report& report, const RunOutcome& outcome);

    // Returns the number of steps of the undisturbed run. A failure at a step from this number on
    // never occurs.
    std::size_t GetStepCount() const { return fStepCount; }

    std::size_t GetGLCount() const { return fGLCount; }
    std::size_t GetCLCount() const { return fCLCount; }
    bool HasOpenCL() const { return fHasOpenCL; }

    // Predicts a run with this failure at this step.
    Prediction Predict(StepFailure failure, std::size_t step) const;

private:
    // One test of one device, or one test that belongs to no device.
    struct Operation {
        std::string fTag; // of the device; empty for none
        std::vector<ExpectedLine> fLines;
        std::vector<std::string> fErrors; // printed whether or not the step fails
        bool fTakesStep = true;
        bool fFails = false; // in the undisturbed run
    };

    void AddReportKey(const Report& report, const KnownKey& key);
    std::size_t AddDevices(const Report& report, const SequenceReader& sequence, DeviceKind kind);
    void AddFailureTexts(const RunOutcome& outcome);

    std::vector<Operation> fOperations;
    std::size_t fGLCount = 0;
    std::size_t fCLCount = 0;
    bool fHasOpenCL = false;
    int fStatus = 0;
    std::size_t fStepCount = 0;
};

// Returns the differences between a run and its prediction, with the lines around the first one;
// empty if there are none. Comments, and messages of drivers on standard error, are ignored.
std::string ShowDifference(const Prediction& expected, const Report& report,
                           const RunOutcome& outcome);

} // namespace assay_host
