// The command line of assay-host.
#pragma once

#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "supervise/StepRules.h"

namespace assay_host {

enum class Format { kText, kJson, kJsonLines };

struct ChildChoice {
    std::string fProgram; // empty: the one that is found
    std::vector<std::string> fArgs;
    double fTimeoutSeconds = 60;
};

struct RunChoice {
    ChildChoice fChild;
    Format fFormat = Format::kText;
    bool fRaw = false;
    std::string fOutput; // empty: standard output
};

struct TortureChoice {
    ChildChoice fChild;
    std::vector<StepFailure> fFailures;
};

struct DiffChoice {
    std::string fBefore;
    std::string fAfter;
    double fTolerance = 0.1;
};

using Choice = std::variant<RunChoice, TortureChoice, DiffChoice>;

// Statuses beside those of the verdicts.
constexpr int kTroubleStatus = 10;
constexpr int kDifferentStatus = 1;
constexpr int kDiffTroubleStatus = 2;

struct Parsed {
    std::optional<Choice> fChoice; // nothing if the program is to end at once
    int fStatus = 0;               // with which it ends then
    std::string fText;             // what it says then, on standard output for the status 0
};

// `words`: the command line without the program's name.
Parsed ParseCommandLine(const std::vector<std::string>& words);

} // namespace assay_host
