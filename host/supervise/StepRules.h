// What a child that is told to fail at a step must do: the rules of docs/report-format.md, applied
// to what an undisturbed run has shown of the machine.
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

// "crashAfter", "throwAfter".
const char* GetOptionName(StepFailure failure);

struct ExpectedLine {
    std::string fText; // as the undisturbed run had it
    Match fMatch = Match::kExact;

    bool Matches(const std::string& text) const;
};

struct Prediction {
    std::vector<ExpectedLine> fLines;
    std::vector<std::string> fErrors; // what the child itself says on standard error
    int fStatus = 0;
};

class StepRules {
public:
    // From an undisturbed run. Throws std::runtime_error with what is wrong if the run didn't come
    // to its end or isn't what the rules say itself.
    StepRules(const Report& report, const RunOutcome& outcome);

    // How many steps that run took; a failure at this one or behind it never comes.
    std::size_t GetStepCount() const { return fStepCount; }

    std::size_t GetGLCount() const { return fGLCount; }
    std::size_t GetCLCount() const { return fCLCount; }
    bool HasOpenCL() const { return fHasOpenCL; }

    Prediction Predict(StepFailure failure, std::size_t step) const;

private:
    // One question put to one device or to none.
    struct Operation {
        std::string fTag; // of the device; empty for none
        std::vector<ExpectedLine> fLines;
        std::vector<std::string> fErrors; // said in any case
        bool fTakesStep = true;
        bool fFails = false; // by itself
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

// The lines in which a child differs from its prediction, a few before the first one with it; empty
// if it is as predicted. Comments, and what drivers say on standard error, don't count.
std::string ShowDifference(const Prediction& expected, const Report& report,
                           const RunOutcome& outcome);

} // namespace assay_host
