// Parses the command line of assay-host.
#pragma once

#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "series/Series.h"
#include "supervise/StepRules.h"

namespace assay_host {

enum class Format { kText, kJson, kJsonLines, kHtml, kPrometheus, kNodeFeatures, kAnsible };

// What the exit status of a run shows: its verdict, or whether these interfaces can be used.
enum class Need { kNothing, kOpenGL, kOpenCL, kBoth };

struct ChildChoice {
    std::string fProgram; // empty: as FindAssay() finds it
    std::vector<std::string> fArgs;
    double fTimeoutSeconds = 60; // 0: no limit
};

struct RunChoice {
    ChildChoice fChild;
    Format fFormat = Format::kText;
    int fSchema = 2; // of the JSON forms
    Need fNeed = Need::kNothing;
    bool fIdentify = false;
    bool fRaw = false;
    SeriesPlan fSeries;  // a single run if nothing is asked for
    std::string fOutput; // empty: standard output
};

struct TortureChoice {
    ChildChoice fChild;
    std::vector<StepFailure> fFailures;
};

enum class AdviceFormat { kText, kVariables, kJson };

struct AdviseChoice {
    ChildChoice fChild;
    std::string fState; // the folder
    AdviceFormat fFormat = AdviceFormat::kText;
    Need fNeed = Need::kOpenGL;
    bool fDryRun = false;
    bool fFresh = false;
    double fWaitSeconds = 10;
    double fMaxAgeDays = 30;
    double fPauseSeconds = 60; // before the second attempt after a failure
    unsigned fRetries = 2;
    double fForgiveDays = 7;
    double fKeepAbsentSeconds = 600;
    double fKeepUnknownSeconds = 60;
    unsigned fPauseGrowth = 60; // each further pause is longer by this factor
    double fForgiveFreezeDays = 30;
    unsigned fUnclear = 3; // attempts in a row that showed nothing, before there is a pause
    double fUnclearPauseSeconds = 600;
};

enum class StateAction { kList, kShow, kForget, kSet };

struct StateChoice {
    StateAction fAction = StateAction::kList;
    std::string fState;              // the folder
    std::vector<std::string> fWords; // entries, or choices of kSet
};

struct CheckChoice {
    ChildChoice fChild;
    std::vector<std::string> fRequirements;
    std::vector<std::string> fRequirementFiles;
    std::vector<std::string> fReports; // files; empty: run the child
    std::string fState;                // the folder of advise to check instead; empty: none
    double fMaxAgeDays = 30;           // of what is in it
    std::string fBaseline;             // a file; empty: none
    double fTolerance = 0.1;           // of the baseline, as MeasurementRule::fTolerance
};

struct DiffChoice {
    Format fFormat = Format::kText; // or kJson, kHtml
    std::string fOutput;            // empty: standard output
    std::string fBefore;
    std::vector<std::string> fAfter; // at least one
    double fTolerance = 0.1;         // as MeasurementRule::fTolerance
    // Of two series; nothing if only the test of their samples decides.
    std::optional<double> fSeriesTolerance;
    bool fIdentity = false; // compare the machines' names and the times too
    bool fAll = false;      // as ComparisonOptions::fAll
};

struct ShowChoice {
    std::string fReport; // a file
    Format fFormat = Format::kText;
    int fSchema = 2;     // of the document
    std::string fOutput; // empty: standard output
};

struct BugReportChoice {
    ChildChoice fChild;
    std::string fOutput; // empty: a name with the time, in the current folder
    bool fYes = false;   // write without asking
};

struct ExplainChoice {
    std::vector<std::string> fKeys; // empty: all are listed
};

using CommandChoice = std::variant<RunChoice, TortureChoice, DiffChoice, ShowChoice, ExplainChoice,
                                   CheckChoice, AdviseChoice, StateChoice, BugReportChoice>;

// Exit statuses other than those of the verdicts.
constexpr int kErrorStatus = 10; // of all but diff
constexpr int kUnmetStatus = 7;  // of check
constexpr int kDifferentStatus = 1;
constexpr int kDeclinedStatus = 1; // of bugreport
constexpr int kDiffErrorStatus = 2;

struct Parsed {
    std::optional<CommandChoice> fChoice; // empty if the program must end at once
    // Only without a choice: the exit status, and what to print before. The text goes to standard
    // output if the status is 0, otherwise to standard error.
    int fStatus = 0;
    std::string fText;
};

// Parses the words of the command line after the program's name, in UTF-8. Never throws for what
// the words are.
Parsed ParseCommandLine(const std::vector<std::string>& words);

} // namespace assay_host
