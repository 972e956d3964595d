// Derives the verdict on a run from what was observed. One thread at a time.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "pmutil/TrackingLauncher.h"
#include "report/CopyClock.h"
#include "report/ReportLine.h"
#include "report/RunOutcome.h"
#include "report/SequenceReader.h"

namespace assay_host {

// The state of a report while it arrives.
class ReportProgress {
public:
    // Reads the next line. Any line is accepted.
    void Add(const ReportLine& line);

    // Whether a key=value line has come.
    bool HasValues() const { return fHasValues; }

    // Whether the start stamp and the end stamp have come, both whole.
    bool IsWhole() const { return fHasStart && fHasEnd; }

    // Returns the last key=value line and its key; empty if there is none.
    const std::string& GetLastReportLine() const { return fLastReportLine; }
    const std::string& GetLastKey() const { return fLastKey; }

    // Returns the last log line after the last key=value line; empty if there is none.
    const std::string& GetLastLogLine() const { return fLastLogLine; }

    const SequenceReader& GetSequence() const { return fSequence; }

    const std::vector<LowerBound>& GetLowerBounds() const { return fCopies.GetBounds(); }

private:
    bool fHasValues = false;
    bool fHasStart = false;
    bool fHasEnd = false;
    std::string fLastReportLine;
    std::string fLastKey;
    std::string fLastLogLine;
    SequenceReader fSequence;
    CopyClock fCopies;
};

// Why the host killed the child.
enum class KillReason { kNone, kTimeout, kInterrupt };

// What was observed of a run.
struct Evidence {
    std::string fStartFailure;            // why the child could not be started; empty if it was
    std::optional<pmutil::ChildEnd> fEnd; // empty if the child's end was not observed
    KillReason fKillReason = KillReason::kNone;
    ReportProgress fReport;
};

// Sets the verdict, the exit status, the termination, the reason, the last lines and the lower
// bounds of the outcome. Its command and its error lines must be set before.
void Judge(const Evidence& evidence, RunOutcome& outcome);

// Returns the value of the last -exit= option as the child parses it; 0 without one.
std::int32_t GetRequestedStatus(const std::vector<std::string>& options);

} // namespace assay_host
