// A series of runs on one machine. Value types, which a document stores.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "report/KnownKeys.h"
#include "report/RunOutcome.h"
#include "report/Usable.h"

namespace assay_host {

// What was asked for: the series ends at the first limit that it reaches, after at least one run.
struct SeriesPlan {
    std::size_t fRuns = 0; // 0: no limit
    double fSeconds = 0;   // no run starts later; 0: no limit

    bool IsAsked() const { return fRuns > 0 || fSeconds > 0; }
};

// What one run has of a measurement.
struct SeriesSample {
    std::size_t fRun = 1;  // the first run is 1
    double fValue = 0;     // finite; only of a known one
    std::string fReason{}; // why it isn't known; empty if it is
    std::string fText{};   // the report's value, if it isn't known; empty if there is none

    bool IsKnown() const { return fReason.empty(); }
};

// A measurement of one device, or the time that the runs took.
struct Measurement {
    const KnownKey* fKey = nullptr; // null for the time of the runs, in seconds
    std::string fTag;               // of the device in the run that is shown; empty for the time
    std::string fName;              // of the device, raw bytes; may be empty
    std::vector<SeriesSample> fSamples; // in the order of the runs, of those that have the device

    // Returns the key's name, or "seconds".
    std::string GetKeyName() const { return fKey != nullptr ? fKey->fKey : "seconds"; }
};

// Something that changed between the runs.
struct SeriesFinding {
    std::string fCode;              // a stable identifier; docs/repeat.md has the list
    std::string fTag;               // of the device; empty for a finding about the runs
    std::string fText;              // one sentence for the user, safe to write to a terminal
    std::size_t fCount = 0;         // the runs that differ from the others
    std::vector<std::size_t> fRuns; // the first kMaxNamedRuns of these
};

constexpr std::size_t kMaxNamedRuns = 20;

enum class SeriesEnd {
    kDone,        // as asked for
    kInterrupted, // before
    kGivenUp,     // the child can't run: each further run would end the same way
    kFull         // at kMaxSeriesSamples
};

// Returns "done", "interrupted", "given-up" or "full".
const char* GetSeriesEndName(SeriesEnd end);

// A series ends when it has as many samples: its document must stay readable.
constexpr std::size_t kMaxSeriesSamples = 100000;

struct VerdictCount {
    Verdict fVerdict;
    std::size_t fRuns;
};

struct Series {
    SeriesPlan fPlan;
    SeriesEnd fEnd = SeriesEnd::kDone;
    std::size_t fRuns = 0;                   // that were started
    std::size_t fShown = 1;                  // the run that everything besides the series describes
    double fSeconds = 0;                     // from the first launch to the last end
    std::vector<VerdictCount> fVerdicts;     // those that came, from the best to the worst
    Usability fOpenGL = Usability::kUnknown; // the worst of all runs
    Usability fOpenCL = Usability::kUnknown;
    std::vector<SeriesFinding> fFindings;
    std::vector<Measurement> fMeasurements;
};

} // namespace assay_host
